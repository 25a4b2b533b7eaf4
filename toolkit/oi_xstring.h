// Small bridges between C++ strings and the char* and XmString types of Xt and Motif.
#pragma once

#include <Xm/Xm.h>

#include <string>

// Xt declares String as char*; resource names and literals are passed through this one helper.
inline String oiStr(const char* s) { return const_cast<String>(s); }

// An XmString that is freed when it goes out of scope.
class OI_XmString {
 public:
  explicit OI_XmString(const std::string& text)
      : s_(XmStringGenerate(const_cast<char*>(text.c_str()), nullptr, XmCHARSET_TEXT, nullptr)) {}
  ~OI_XmString() { XmStringFree(s_); }
  OI_XmString(const OI_XmString&) = delete;
  OI_XmString& operator=(const OI_XmString&) = delete;
  operator XmString() const { return s_; }

 private:
  XmString s_;
};

// The plain text of an XmString (empty for null).
std::string oiXmStringText(XmString s);
