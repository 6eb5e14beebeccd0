// Values that hosts and files bring: the typed conversions, level words and the tokenizer. The
// input is a text, and after a zero byte the delimiters.
#include <cerrno>
#include <climits>
#include <cstdint>
#include <cstdlib>
#include <cstring>
#include <string>
#include <string_view>

#include <strings.h>

#include <qlx/class/props.h>
#include <qlx/level.h>
#include <qlx/memory.h>
#include <qlx/props.h>

static void require(bool holds) {
  if (!holds) abort();
}

// Runs a conversion with and without its flag; gives the flag.
template <typename Convert>
static uint8_t isOk(Convert convert, const char *text) {
  uint8_t ok = 7;
  const auto value = convert(text, &ok);
  const auto again = convert(text, nullptr);
  // NOLINTNEXTLINE(bugprone-suspicious-memory-comparison): to the last bit, also what is no number
  require(memcmp(&value, &again, sizeof value) == 0);
  require(ok <= 1);
  require(ok == 1 || value == 0);
  return ok;
}

static void convert(const char *text) {
  const bool isTrue = strcasecmp(text, "true") == 0, isFalse = strcasecmp(text, "false") == 0;
  require(isOk(qlxPropStrToBool, text) == (isTrue || isFalse));
  require(qlxPropStrToBool(text, nullptr) == isTrue);
  require(isOk(qlxPropStrToChar, text) == 1);
  require(qlxPropStrToChar(text, nullptr) == *text);
  isOk(qlxPropStrToInt32, text);
  isOk(qlxPropStrToFloat32, text);
  isOk(qlxPropStrToFloat64, text);

  char *end = nullptr;
  errno = 0;
  const long long expected = strtoll(text, &end, 10);
  const bool isNumber = end != text;
  require(isOk(qlxPropStrToInt64, text) == isNumber);
  if (!isNumber || errno == ERANGE) return;
  require(qlxPropStrToInt64(text, nullptr) == expected);
  if (expected < INT_MIN || expected > INT_MAX) return;
  require(qlxPropStrToInt32(text, nullptr) == expected);
  require(QlxGetLevelFromString(text) == expected);
}

static void tokenize(const char *text, const char *delims) {
  std::string joined, expected;
  const std::string_view set = delims;
  for (const char *p = text; *p; ++p)
    if (set.find(*p) == std::string_view::npos) expected += *p;
  for (QlxStrTok state = QlxStrTokIterator(text, delims); QlxStrTokIterHasNext(state);
       state = QlxStrTokIterNext(state)) {
    char *token = QlxStrTokIterGet(state);
    require(token && *token);
    require(set.empty() ? token[1] == 0 : strpbrk(token, delims) == nullptr);
    joined += token;
    OslMemoryFree(token);
  }
  require(joined == expected);
}

extern "C" int LLVMFuzzerTestOneInput(const uint8_t *data, size_t size) {
  const std::string input(reinterpret_cast<const char *>(data), size);
  const std::string text = input.c_str();
  const std::string delims = text.size() < size ? input.c_str() + text.size() + 1 : "";
  convert(text.c_str());
  QlxGetLevelFromString(text.c_str());
  tokenize(text.c_str(), delims.c_str());
  return 0;
}
