// The file handlers while system calls fail: writers that log numbered records and note what each
// log call answered, with strace making calls of theirs fail. The rules:
//
// every record whose log call answered success stands in exactly one generation, whole, on a line
// of its own, no record stands there twice, and those of one process are in their order; no other
// file is touched or made; nobody crashes or hangs; when no call fails any more every record is
// taken; no descriptor stays open. Exit status 0 only when they held.
#include <cstdio>
#include <cstring>
#include <string>

#include "Run.h"

static int showUsage() {
  std::fprintf(stderr,
               "usage: qlx_faults [--keep] VARIANT [CALL ERROR WHEN]\n"
               "WHEN is N, N+, N+STEP or N..LAST; CALL \"cut\" has a number of bytes as ERROR\n"
               "variants: %s\n",
               variantNames().c_str());
  return 2;
}

// Figures in the order of scripts/injectFaults, and what is wrong.
static void print(const Variant &variant, const Fault &fault, const Verdict &found) {
  std::printf("%s\t%s\t%s\t%s\t%ju\t%ju\t%ju\t%ju\t%ju\t%ju\t%ju\t%ju\t%s\n", variant.name,
              fault.call.c_str(), fault.error.c_str(), fault.when.c_str(), found.injected,
              found.acknowledged, found.lost, found.lostCopies, found.doubled, found.torn,
              found.hangs, found.crashes, found.wrong.c_str());
}

int main(int, char **argv) {
  const bool keeps = argv[1] && !std::strcmp(argv[1], "--keep");
  char **const words = argv + 1 + keeps;
  const Variant *const variant = words[0] ? findVariant(words[0]) : nullptr;
  if (!variant) return showUsage();
  Fault fault;
  if (words[1]) {
    if (!words[2] || !words[3] || words[4]) return showUsage();
    fault = {words[1], words[2], words[3]};
  }
  std::string folder;
  const Verdict found = runOnce(*variant, fault, keeps ? &folder : nullptr);
  print(*variant, fault, found);
  if (keeps) std::fprintf(stderr, "kept: %s\n", folder.c_str());
  return found.wrong.empty() ? 0 : 1;
}
