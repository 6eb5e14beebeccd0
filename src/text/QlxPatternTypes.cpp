// The scan of a message pattern for its arguments' types: one pass, no memory.
#include "QlxPatternTypes.h"

#include <string_view>

#include <unicode/uchar.h>

#include "QlxPatternNesting.h"
#include "util/CxUnits.h"

namespace {

// A part of an argument. One that is longer than any word or index reads as empty.
class Word {
 public:
  void add(UChar c) {
    if (length_ < kMaxUnits) units_[length_] = c;
    ++length_;
  }
  std::u16string_view view() const {
    return length_ > kMaxUnits ? std::u16string_view{} : std::u16string_view{units_, length_};
  }

 private:
  static constexpr size_t kMaxUnits = 10;  // the digits of an index
  UChar units_[kMaxUnits];
  size_t length_ = 0;
};

struct Argument {
  Word parts[3];  // index, type, style
  int part = 0;
  int depth = 0;  // nested braces in the style

  bool inStyle() const { return part == 2; }
};

ArgType typeOf(const Argument &argument) {
  if (argument.part == 0) return ArgType::kString;
  const std::u16string_view type = argument.parts[1].view();
  if (type == u"choice") return ArgType::kDouble;
  if (type != u"number") return ArgType::kNone;
  return argument.parts[2].view() == u"integer" ? ArgType::kInteger : ArgType::kDouble;
}

// The argument's index; -1 when it is no number of one to ten digits.
int64_t indexOf(const Argument &argument) {
  const std::u16string_view digits = argument.parts[0].view();
  if (digits.empty()) return -1;
  int64_t index = 0;
  for (const UChar c : digits) {
    if (c < u'0' || c > u'9') return -1;
    index = index * 10 + (c - u'0');
  }
  return index;
}

class Scanner {
 public:
  explicit Scanner(const UChar *pattern) : at_(pattern) {}

  bool scan(ArgTypes *types) {
    for (bool quoted = false; *at_; ++at_) {
      if (*at_ == u'\'') {
        quoted = !quoted;  // two in a row, which stand for one, do it twice
      } else if (*at_ == u'{' && !quoted) {
        ++at_;
        if (!scanArgument(types)) return false;
      }
    }
    return true;
  }

 private:
  // From behind the opening brace to the closing one.
  bool scanArgument(ArgTypes *types) {
    Argument argument;
    for (bool quoted = false; *at_; ++at_) {
      if (*at_ == u'\'')
        quoted = !quoted;
      else if (quoted)
        argument.parts[argument.part].add(*at_);
      else if (*at_ == u'}' && argument.depth == 0)
        return store(argument, types);
      else if (!take(&argument))
        return false;
    }
    return false;  // still open at the end
  }

  bool take(Argument *argument) {
    const UChar c = *at_;
    if (u_hasBinaryProperty(c, UCHAR_PATTERN_WHITE_SPACE)) return true;  // as ICU skips it
    if (c == u',' && !argument->inStyle()) {
      ++argument->part;
      return true;
    }
    if (c == u'{' && !argument->inStyle()) return false;
    if (c == u'{') ++argument->depth;
    if (c == u'}') --argument->depth;
    argument->parts[argument->part].add(c);
    return true;
  }

  static bool store(const Argument &argument, ArgTypes *types) {
    const int64_t index = indexOf(argument);
    if (index < 0) return false;
    if (index < static_cast<int64_t>(types->size())) {
      (*types)[static_cast<size_t>(index)] = typeOf(argument);
    }
    return true;
  }

  const UChar *at_;
};

}  // namespace

bool qlxScanPatternTypes(const UChar *pattern, ArgTypes *types) {
  types->fill(ArgType::kNone);
  if (qlxNestsTooDeep({pattern, cxUnitsLength(pattern)})) return false;
  return Scanner(pattern).scan(types);
}
