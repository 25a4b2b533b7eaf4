// Where an operation sends what it has to tell the user, since the engine never prints:
// the console of the console modes and of the window, or a list that tests and callers
// read afterwards.
#pragma once

#include <string>
#include <vector>

class MessageSink {
 public:
  virtual ~MessageSink() = default;
  // Data set aside or refused (the console shows it on standard error).
  virtual void warning(const std::string& text) = 0;
  // Damaged input that is processed anyway (the console shows it on standard output).
  virtual void notice(const std::string& text) = 0;
};

// Writes each message as it comes, flushing the other stream first so that the two
// interleave as they were produced. The texts carry their own line ends.
class ConsoleMessages : public MessageSink {
 public:
  // Notices go to standard output in the window mode; the console modes keep standard
  // output for their report, so there they go to standard error.
  explicit ConsoleMessages(bool noticesToStandardError = false) : noticesToStderr_(noticesToStandardError) {}
  void warning(const std::string& text) override;
  void notice(const std::string& text) override;

 private:
  bool noticesToStderr_;
};

// Keeps the messages in order.
class MessageList : public MessageSink {
 public:
  struct Message {
    bool warning;
    std::string text;
  };
  void warning(const std::string& text) override { messages.push_back({true, text}); }
  void notice(const std::string& text) override { messages.push_back({false, text}); }
  std::vector<Message> messages;
};
