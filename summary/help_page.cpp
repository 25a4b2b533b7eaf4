// The manual's page, the Help menus' topics and the browser command's line and failures.
#include "summary/help_page.h"

#include <sys/wait.h>

#include <cstring>

#include "settings/resource_database.h"

const std::vector<KG_HelpTopic>& kgMainWindowHelpTopics() {
  static const std::vector<KG_HelpTopic> topics = {
      {"kgHelpManual", "Manual", ""},
      {"kgHelpFirstSteps", "Getting coverage into the viewer", "getting-coverage-into-the-viewer"},
      {"kgHelpMainWindow", "The main window", "the-main-window"},
      {"kgHelpSourceWindow", "The annotated source window", "the-annotated-source-window"},
      {"kgHelpAdjustments", "Adjustments", "adjustments"},
      {"kgHelpScripts", "Scripts", "scripts"},
      {"kgHelpKeys", "Keys", "keys"},
      {"kgHelpResources", "Resources", "resources"},
      {"kgHelpCommandLine", "Command line", "command-line"},
  };
  return topics;
}

const std::vector<KG_HelpTopic>& kgSourceWindowHelpTopics() {
  static const std::vector<KG_HelpTopic> topics = {
      {"kgHelpManual", "Manual", ""},
      {"kgHelpSourceWindow", "The annotated source window", "the-annotated-source-window"},
      {"kgHelpAdjustments", "Adjustments", "adjustments"},
      {"kgHelpKeys", "Keys", "keys-of-the-annotated-source-window"},
  };
  return topics;
}

const std::vector<KG_ContextTopic>& kgMainWindowContextTopics() {
  static const std::vector<KG_ContextTopic> topics = {
      {"kgFilePulldown", "main-file-menu"},
      {"kgViewPulldown", "main-view-menu"},
      {"kgActions", "main-actions-menu"},
      {"kgAdjustmentsPulldown", "main-adjustments-menu"},
      {"kgDebugPulldown", "main-debug-menu"},
      {"kgHelpPulldown", "main-help-menu"},
      {"toolbar", "the-toolbar"},
      {"kgOutline", "keys-of-the-main-window"},
  };
  return topics;
}

const std::vector<KG_ContextTopic>& kgSourceWindowContextTopics() {
  static const std::vector<KG_ContextTopic> topics = {
      {"kgFilePulldown", "source-file-menu"},
      {"kgViewPulldown", "source-view-menu"},
      {"kgHelpPulldown", "source-help-menu"},
      {"kgAdjustPane", "marking-lines-in-the-window"},
      {"kgDetailSearch", "keys-of-the-annotated-source-window"},
  };
  return topics;
}

std::string kgContextAnchor(const std::vector<KG_ContextTopic>& topics, const std::vector<std::string>& names,
                            const std::string& fallback) {
  for (const std::string& name : names)
    for (const KG_ContextTopic& t : topics)
      if (name == t.widget) return t.anchor;
  return fallback;
}

std::string kgHelpPagePath(const std::string& installDir) { return installDir + "/help/manual.html"; }

std::string kgFileUrl(const std::string& path, const std::string& anchor) {
  static const char hex[] = "0123456789ABCDEF";
  std::string url = "file://";
  for (unsigned char c : path) {
    const bool plain = (c >= 'A' && c <= 'Z') || (c >= 'a' && c <= 'z') || (c >= '0' && c <= '9') ||
                       strchr("-._~/", c) != nullptr;
    if (plain && c != '\0') {
      url += static_cast<char>(c);
    } else {
      url += '%';
      url += hex[c >> 4];
      url += hex[c & 15];
    }
  }
  if (!anchor.empty()) url += "#" + anchor;
  return url;
}

std::vector<std::string> kgHelpCommandArgv(const std::string& command, const std::string& url) {
  // "$1" is the URL as one argument whatever it holds; "kestrel-help" is $0, the name the
  // shell gives in its own messages.
  return {"/bin/sh", "-c", command + " \"$1\"", "kestrel-help", url};
}

std::string kgFillIn(const std::string& text, const std::vector<std::string>& args) {
  std::string out;
  size_t next = 0;
  for (size_t i = 0; i < text.size(); ++i) {
    if (text[i] == '%' && i + 1 < text.size() && text[i + 1] == 's' && next < args.size()) {
      out += args[next++];
      ++i;
    } else {
      out += text[i];
    }
  }
  return out;
}

std::string kgHelpFailureText(const std::string& command, const std::string& page, int status, int error) {
  if (status == -1) {
    return kgFillIn(namedText("helpBrowserNotStarted",
                              "The help browser command could not be started:\n  %s\n(%s)\n"
                              "The manual is the page\n  %s"),
                    {command, strerror(error), page});
  }
  if (WIFEXITED(status)) {
    const int code = WEXITSTATUS(status);
    if (code == 0) return {};
    // The shell's own codes for a command it could not find or run.
    if (code == 127 || code == 126) {
      return kgFillIn(namedText("helpBrowserNotFound",
                                "The help browser command could not be started (not found or not executable):\n"
                                "  %s\nThe manual is the page\n  %s"),
                      {command, page});
    }
    return kgFillIn(namedText("helpBrowserFailed",
                              "The help browser command failed with exit status %s:\n  %s\n"
                              "The manual is the page\n  %s"),
                    {std::to_string(code), command, page});
  }
  const int signal = WIFSIGNALED(status) ? WTERMSIG(status) : 0;
  return kgFillIn(namedText("helpBrowserKilled",
                            "The help browser command was ended by signal %s:\n  %s\n"
                            "The manual is the page\n  %s"),
                  {std::to_string(signal), command, page});
}

std::string kgHelpPageMissingText(const std::string& page) {
  return kgFillIn(namedText("helpPageMissing", "The manual is not installed: there is no page\n  %s"), {page});
}
