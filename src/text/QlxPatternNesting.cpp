// The walk over a pattern's messages, without calls to itself. It follows the parser of ICU's
// message patterns where that tells what is nested, and goes on over what that refuses.
#include "QlxPatternNesting.h"

#include <algorithm>
#include <iterator>

#include <unicode/uchar.h>

namespace {

// Of an argument, by what its style is made of.
enum class Style : uint8_t { kSimple, kChoice, kPlural, kSelect };

struct StyledType {
  std::u16string_view word;
  Style style;
};

constexpr StyledType kStyledTypes[] = {
    {u"choice", Style::kChoice},
    {u"plural", Style::kPlural},
    {u"select", Style::kSelect},
    {u"selectordinal", Style::kPlural},
};

UChar lowerOf(UChar unit) {
  return unit >= u'A' && unit <= u'Z' ? static_cast<UChar>(unit | 0x20) : unit;
}

Style styleOf(std::u16string_view type) {
  const auto *row = std::ranges::find_if(kStyledTypes, [&](const StyledType &known) {
    return std::ranges::equal(type, known.word, {}, lowerOf);
  });
  return row != std::end(kStyledTypes) ? row->style : Style::kSimple;
}

class Walk {
 public:
  explicit Walk(std::u16string_view pattern) : rest_(pattern) {}

  int deepest() {
    while (!rest_.empty() && level_ <= kMaxPatternNesting) {
      const UChar unit = take();
      if (unit == u'\'')
        skipQuoted();
      else if (unit == u'{')
        enterArgument();
      else if (endsMessage(unit))
        leaveMessage(unit);
      deepest_ = std::max(deepest_, level_);
    }
    return deepest_;
  }

 private:
  // 0 at the end, which no syntax is.
  UChar take() {
    if (rest_.empty()) return 0;
    const UChar unit = rest_.front();
    rest_.remove_prefix(1);
    return unit;
  }

  void skip(size_t units) { rest_.remove_prefix(std::min(units, rest_.size())); }

  void skipTo(std::u16string_view units) { skip(rest_.find_first_of(units)); }

  void skipSpace() {
    while (!rest_.empty() && u_hasBinaryProperty(rest_.front(), UCHAR_PATTERN_WHITE_SPACE)) skip(1);
  }

  Style parent() const { return styles_[level_]; }  // of the argument that the message is in

  // In a message an apostrophe quotes only before syntax, to the next one that is not doubled.
  void skipQuoted() {
    const UChar unit = rest_.empty() ? u'\0' : rest_.front();
    if (unit == u'\'') return skip(1);
    const bool quotes = unit == u'{' || unit == u'}' ||
                        (parent() == Style::kChoice && unit == u'|') ||
                        (parent() == Style::kPlural && unit == u'#');
    if (!quotes) return;
    size_t end = rest_.find(u'\'');
    while (end != rest_.npos && rest_.substr(end).starts_with(u"''"))
      end = rest_.find(u'\'', end + 2);
    skip(end == rest_.npos ? end : end + 1);
  }

  bool endsMessage(UChar unit) const {
    return level_ > 0 && (unit == u'}' || (unit == u'|' && parent() == Style::kChoice));
  }

  // From behind an argument's opening brace into its first message, or behind the argument.
  void enterArgument() {
    skipTo(u",}");
    if (take() != u',') return;
    skipSpace();
    const auto isLetter = [](UChar unit) { return lowerOf(unit) >= u'a' && lowerOf(unit) <= u'z'; };
    const auto *end = std::ranges::find_if_not(rest_, isLetter);
    const std::u16string_view type = rest_.substr(0, static_cast<size_t>(end - rest_.begin()));
    skip(type.size());
    skipSpace();
    if (take() != u',') return;
    const Style style = styleOf(type);
    if (style == Style::kSimple)
      skipSimpleStyle();
    else
      enterMessage(style);
  }

  // In a simple style every apostrophe quotes.
  void skipSimpleStyle() {
    for (size_t braces = 1; braces > 0 && !rest_.empty();) {
      const UChar unit = take();
      if (unit == u'\'') {
        skipTo(u"'");
        skip(1);
      }
      if (unit == u'{') ++braces;
      if (unit == u'}') --braces;
    }
  }

  // From behind a comma or a message into the style's next one, or behind the argument.
  void enterMessage(Style style) {
    skipTo(style == Style::kChoice ? u"#<\u2264" : u"{}");
    if (rest_.empty() || take() == u'}') return;
    if (++level_ <= kMaxPatternNesting) styles_[level_] = style;
  }

  void leaveMessage(UChar unit) {
    const Style left = parent();
    --level_;
    if (left != Style::kChoice || unit == u'|') enterMessage(left);
  }

  std::u16string_view rest_;
  int level_ = 0;
  int deepest_ = 0;
  Style styles_[kMaxPatternNesting + 1] = {};  // by level; the pattern itself is in no argument
};

}  // namespace

int qlxPatternNesting(std::u16string_view pattern) {
  return Walk(pattern).deepest();
}
