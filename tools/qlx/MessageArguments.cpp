#include "MessageArguments.h"

#include <algorithm>
#include <charconv>
#include <cstring>

#include <unicode/localpointer.h>
#include <unicode/locid.h>
#include <unicode/messagepattern.h>
#include <unicode/unistr.h>
#include <unicode/ures.h>

#include <qlx/memory.h>
#include <qlx/ustring.h>

#include "text/QlxArgType.h"

// As the library finds it: the bundle as it is named, else by the part after its last "/".
static std::optional<icu::UnicodeString> findPattern(const char *bundle, const char *key) {
  UErrorCode status = U_ZERO_ERROR;
  icu::LocalUResourceBundlePointer resources(ures_open(bundle, nullptr, &status));
  if (const char *slash = strrchr(bundle, '/'); U_FAILURE(status) && slash) {
    status = U_ZERO_ERROR;
    resources.adoptInstead(ures_open(slash + 1, nullptr, &status));
  }
  int32_t length = 0;
  const UChar *text = ures_getStringByKey(resources.getAlias(), key, &length, &status);
  if (U_FAILURE(status)) return std::nullopt;
  return icu::UnicodeString(text, length);
}

// A part's text as its meaning is read: without blanks around it, in any letter case.
static icu::UnicodeString word(const icu::MessagePattern &pattern, int32_t part) {
  return pattern.getSubstring(pattern.getPart(part)).trim().toLower(icu::Locale::getRoot());
}

// The type of the argument whose parts start at `part`: the start, its number, and for
// {n,type,style} the type and the style.
static ArgType typeOf(const icu::MessagePattern &pattern, int32_t part) {
  const UMessagePatternArgType type = pattern.getPart(part).getArgType();
  if (type == UMSGPAT_ARG_TYPE_NONE || type == UMSGPAT_ARG_TYPE_SELECT) return ArgType::kString;
  const bool hasStyle = pattern.getPartType(part + 3) == UMSGPAT_PART_TYPE_ARG_STYLE;
  const bool isInteger = type == UMSGPAT_ARG_TYPE_SIMPLE && hasStyle &&
                         word(pattern, part + 2) == u"number" &&
                         word(pattern, part + 3) == u"integer";
  return isInteger ? ArgType::kInteger : ArgType::kDouble;
}

static std::vector<ArgType> argumentTypes(const icu::UnicodeString &text) {
  UErrorCode status = U_ZERO_ERROR;
  const icu::MessagePattern pattern(text, nullptr, status);
  std::vector<ArgType> types;
  if (U_FAILURE(status) || pattern.hasNamedArguments()) return types;
  for (int32_t part = 0; part < pattern.countParts(); ++part) {
    if (pattern.getPartType(part) != UMSGPAT_PART_TYPE_ARG_START) continue;
    const size_t number = pattern.getPart(part + 1).getValue();
    if (number >= types.size()) types.resize(number + 1, ArgType::kString);
    types[number] = typeOf(pattern, part);
  }
  return types;
}

template <typename Number>
static std::optional<MessageArgument> readNumber(const std::string &word) {
  Number number;
  const char *const end = word.data() + word.size();
  const auto [rest, error] = std::from_chars(word.data(), end, number);
  if (error != std::errc() || rest != end) return std::nullopt;
  return number;
}

static std::optional<MessageArgument> readWord(const std::string &word, ArgType type) {
  if (type == ArgType::kInteger) return readNumber<int32_t>(word);
  if (type == ArgType::kDouble) return readNumber<double>(word);
  UChar *text = CxUStringDupStrToUChar(word.c_str());
  const std::u16string result(text ? text : u"");
  OslMemoryFree(text);
  return result;
}

std::optional<std::vector<MessageArgument>> readMessageArguments(
    const char *bundle, const char *key, const std::vector<std::string> &words,
    std::string &problem) {
  std::vector<MessageArgument> arguments;
  const auto pattern = findPattern(bundle, key);
  if (!pattern) return arguments;
  const std::vector<ArgType> types = argumentTypes(*pattern);
  if (types.size() > words.size() || types.size() > kMaxMessageArguments) {
    const size_t most = std::min(words.size(), kMaxMessageArguments);
    problem = "the message has " + std::to_string(types.size()) + " arguments, not " +
              std::to_string(most);
    return std::nullopt;
  }
  for (size_t i = 0; i < types.size(); ++i) {
    const auto argument = readWord(words[i], types[i]);
    if (!argument) {
      problem = "argument {" + std::to_string(i) + "} is " +
                (types[i] == ArgType::kInteger ? "a whole number" : "a number") + ", not \"" +
                words[i] + "\"";
      return std::nullopt;
    }
    arguments.push_back(*argument);
  }
  return arguments;
}
