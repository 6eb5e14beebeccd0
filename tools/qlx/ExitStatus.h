// How the command ends.
#ifndef QLX_TOOLS_EXITSTATUS_H
#define QLX_TOOLS_EXITSTATUS_H

#include <cstdio>
#include <string>

static constexpr int kSuccess = 0, kFailure = 1, kWrongUsage = 2;

// One line on standard error.
inline int failed(const std::string &what, const std::string &why) {
  fprintf(stderr, "qlx: %s: %s\n", what.c_str(), why.c_str());
  return kFailure;
}

#endif
