// Any text as patterns between blanks, and after a zero byte any identifier: each pattern matches
// as the rule says, and the list does when one of its patterns does.
#include <cstdint>
#include <cstdlib>
#include <string>

#include <qlx/class/containers.h>
#include <qlx/class/filter.h>

#include "support/WildcardRule.h"

static void require(bool holds) {
  if (!holds) std::abort();
}

static int checkWords(StringList *list, const std::string &text, const std::string &id) {
  int anyMatches = 0;
  const StringListNode *node = list->head;
  const char *const blanks = " \t\n\r";
  for (size_t at = text.find_first_not_of(blanks); at != std::string::npos; node = node->next) {
    const size_t end = text.find_first_of(blanks, at);
    const std::string word = text.substr(at, end == std::string::npos ? end : end - at);
    require(node && word == node->value);
    const int matches = QlxPatternMatch(word.c_str(), id.c_str());
    require(matches == matchesByTheRule(word, id));
    anyMatches |= matches;
    at = text.find_first_not_of(blanks, end);
  }
  require(!node);
  return anyMatches;
}

extern "C" int LLVMFuzzerTestOneInput(const uint8_t *data, size_t size) {
  const std::string input(reinterpret_cast<const char *>(data), size);
  const std::string text = input.c_str();
  const std::string id = text.size() < size ? input.c_str() + text.size() + 1 : "";
  require(QlxPatternMatch(text.c_str(), id.c_str()) == matchesByTheRule(text, id));
  StringList *list = QlxMsgIdFilterGetStringList(text.c_str());
  require(list && QlxMsgIdFilterMatchMsgId(list, id.c_str()) == checkWords(list, text, id));
  qlxIntlFreeStringList(list);
  return 0;
}
