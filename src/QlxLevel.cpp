// Levels as words and numbers.
#include <qlx/level.h>

#include <stdio.h>

#include <qlx/memory.h>

namespace {

struct LevelWord {
  const char *word;
  int32_t level;
};

// In order: the first word that the text starts with wins.
constexpr LevelWord kLevelWords[] = {
    {"FATAL", FATAL},
    {"ERROR", ERROR},
    {"WARN", WARN},
    {"INFO", INFO},
    {"DEBUG_MIN", DEBUG_MIN},
    {"MIN", DEBUG_MIN},
    {"DEBUG_MID", DEBUG_MID},
    {"MID", DEBUG_MID},
    {"DEBUG_MAX", DEBUG_MAX},
    {"MAX", DEBUG_MAX},
    {"ALL", ALL},
    {"OFF", OFF},
};

constexpr const char *kBlanks = " \t\n\v\f\r";

}  // namespace

int32_t QlxGetLevelFromString(const char *text) {
  if (!text) return UNSPECIFIED;
  // Deliberate: an empty or blank text is ALL, so an empty "level" opens the threshold fully.
  if (text[OslStringStrspn(text, kBlanks)] == '\0') return ALL;
  int level = 0;
  if (sscanf(text, "%d", &level) == 1) return level;
  for (const LevelWord &row : kLevelWords) {
    if (OslStringNICmp(text, row.word, OslStringLen(row.word)) == 0) return row.level;
  }
  return UNSPECIFIED;
}
