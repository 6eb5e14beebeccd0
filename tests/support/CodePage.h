// Makes a code page the process's default one while it lives.
#ifndef QLX_TESTS_CODEPAGE_H
#define QLX_TESTS_CODEPAGE_H

#include <string>

#include <unicode/ucnv.h>

class CodePage {
 public:
  explicit CodePage(const char *name) : former_(ucnv_getDefaultName()) {
    ucnv_setDefaultName(name);
  }
  ~CodePage() { ucnv_setDefaultName(former_.c_str()); }
  CodePage(const CodePage &) = delete;
  CodePage &operator=(const CodePage &) = delete;

 private:
  std::string former_;
};

#endif
