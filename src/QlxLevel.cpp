// Levels as words and numbers.
#include "QlxLevel.h"

#include <stdio.h>

#include <algorithm>
#include <iterator>

#include <qlx/memory.h>

namespace {

struct LevelWord {
  std::string_view word;  // of a configuration
  int32_t level;
  std::string_view recordWord;
};

// In order: the first word that a text starts with wins, and the first row of a level.
constexpr LevelWord kLevelWords[] = {
    {"FATAL", FATAL, "ERROR"},       {"ERROR", ERROR, "ERROR"},
    {"WARN", WARN, "WARN"},          {"INFO", INFO, "INFO"},
    {"DEBUG_MIN", DEBUG_MIN, "MIN"}, {"MIN", DEBUG_MIN, "MIN"},
    {"DEBUG_MID", DEBUG_MID, "MID"}, {"MID", DEBUG_MID, "MID"},
    {"DEBUG_MAX", DEBUG_MAX, "MAX"}, {"MAX", DEBUG_MAX, "MAX"},
    {"ALL", ALL, "OTHER"},           {"OFF", OFF, "OTHER"},
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
    if (OslStringNICmp(text, row.word.data(), static_cast<uint32_t>(row.word.size())) == 0)
      return row.level;
  }
  return UNSPECIFIED;
}

std::string_view qlxLevelWord(int32_t level) {
  const auto *row = std::ranges::find(kLevelWords, level, &LevelWord::level);
  return row != std::end(kLevelWords) ? row->recordWord : "OTHER";
}
