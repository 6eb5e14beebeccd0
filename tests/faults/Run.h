// One run: the writers of a variant, while calls of theirs are made to fail.
#ifndef QLX_TESTS_FAULTS_RUN_H
#define QLX_TESTS_FAULTS_RUN_H

#include <string>

#include "Variants.h"
#include "Verdict.h"

// In strace's words; without a call nothing fails. The call "cut" is the writers' own: writes that
// are short, where the error is the number of bytes that fit.
struct Fault {
  std::string call, error, when;

  bool isNone() const { return call.empty(); }
  bool isCut() const { return call == "cut"; }
};

// `keptFolder` null removes all that was written; else it receives where that is, with the system
// calls in "calls" and the answers in "answers".
Verdict runOnce(const Variant &variant, const Fault &fault, std::string *keptFolder);

#endif
