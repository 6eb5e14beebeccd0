#include "text/QlxPatternNesting.h"

#include <gtest/gtest.h>

#include <pthread.h>

#include <algorithm>
#include <cstdarg>
#include <string>

#include <unicode/messagepattern.h>
#include <unicode/umsg.h>

#include <qlx/class/message.h>

#include "text/QlxComposed.h"
#include "text/QlxFormatCache.h"
#include "text/QlxPatternTypes.h"
#include "support/FailingMemory.h"
#include "support/RandomWords.h"
#include "support/ResourceBundles.h"
#include "support/Take.h"
#include "util/CxOwned.h"
#include "text/QlxMessageCache.h"
#include "text/QlxBundleCache.h"

namespace {

constexpr int kTooDeep = kMaxPatternNesting + 1;

struct Case {
  const char16_t *pattern;
  int nesting;
};

void expectNesting(std::initializer_list<Case> cases) {
  for (const auto &[pattern, nesting] : cases) {
    EXPECT_EQ(qlxPatternNesting(pattern), nesting)
        << ::testing::PrintToString(std::u16string(pattern));
  }
}

// A style that has messages, around an argument.
struct Nest {
  const char16_t *begin, *end, *leaf;

  std::u16string at(int levels) const {
    std::u16string pattern, behind;
    for (int level = 0; level < levels; ++level) {
      pattern += begin;
      behind += end;
    }
    return pattern + leaf + behind;
  }
};

constexpr Nest kSelect{u"{0,select,other{", u"}}", u"{0}"};
constexpr Nest kNests[] = {
    kSelect,
    {u"{0,choice,0#none|1#", u"}", u"{0,number}"},
    {u"{0,plural,one{one}other{", u"}}", u"{0,number}"},
    {u"{0,plural,other{#", u"}}", u"{1,date,full}"},
    {u"{0,plural,other{#", u"}}", u"{0,number,::compact-long currency/EUR}"},
    {u"{0,selectordinal,other{#", u"}}", u"{0,spellout}"},
};

// ---- What nests

TEST(PatternNestingTest, ArgumentsWithoutMessagesDoNotNest) {
  expectNesting({{u"", 0},
                 {u"text } | #", 0},
                 {u"{0} {1,number} {2,date,yyyy'{'} {3,number,{{{}}}}", 0},
                 {u"{0,selected,other{{1,select,other{}}}}", 0}});
}

TEST(PatternNestingTest, AMessageOfAStyleIsOneLevelBelow) {
  expectNesting({{u"{0,select,other{}}", 1},
                 {u"{ 0 , Select , a {x} other {y} }", 1},
                 {u"{0,plural,offset:1 =0{x}other{#}}", 1},
                 {u"{0,selectOrdinal,other{#}}", 1},
                 {u"{0,choice,0#a|1<b|2\u2264c}", 1},
                 {u"{0,select,a{{1}}other{{1,plural,other{{2,choice,0#{3}}}}}}", 3},
                 {u"{0,select,other{{1,select,other{}}}}{0,select,other{}}", 2}});
}

TEST(PatternNestingTest, QuotedBracesDoNotNest) {
  expectNesting({{u"'{0,select,other{'}}'", 0},
                 {u"'{''{0,select,other{x}}", 0},
                 {u"it's {0,select,other{x}}", 1},
                 {u"''{0,select,other{it''s '{'{1,select,other{'}'}}}}", 2},
                 {u"{0,choice,0#'|'1#a|1#{1,select,other{}}}", 2},
                 {u"{0,plural,other{'#{1,select,other{}}'}}", 1},
                 {u"{0,select,other{'#{1,select,other{}}}}", 2},
                 {u"{0,date,''{''}'}{0,select,other{x}}'} {1,select,other{x}}", 1}});
}

TEST(PatternNestingTest, WhatIsDeeperIsNotCounted) {
  for (const Nest &nest : kNests)
    for (const int levels : {0, 1, 7, 8, 9, 10, 1000})
      EXPECT_EQ(qlxPatternNesting(nest.at(levels)), std::min(levels, kTooDeep));
}

TEST(PatternNestingTest, WhatIsOpenAtTheEndCountsToo) {
  for (const Nest &nest : kNests) {
    const Nest open{nest.begin, u"", u""};
    for (const int levels : {1, 8, 9, 100000})
      EXPECT_EQ(qlxPatternNesting(open.at(levels)), std::min(levels, kTooDeep));
  }
}

// ---- Beside ICU's parser

// The deepest level that ICU comes to, and whether it can read the pattern.
struct Parsed {
  int nesting = 0;
  bool readable;

  explicit Parsed(const std::u16string &text) {
    UErrorCode status = U_ZERO_ERROR;
    icu::MessagePattern pattern(status);
    pattern.parse(icu::UnicodeString(text.c_str()), nullptr, status);
    readable = U_SUCCESS(status);
    for (int32_t i = 0; i < pattern.countParts(); ++i)
      if (pattern.getPartType(i) == UMSGPAT_PART_TYPE_MSG_START)
        nesting = std::max(nesting, pattern.getPart(i).getValue());
  }
};

class Patterns : RandomWords<char16_t> {
 public:
  Patterns() : RandomWords(20061121) {}

  std::u16string next() { return message(static_cast<int>(below(11)), u' '); }

  // One with a unit left out, doubled or put in the place of another, or cut off.
  std::u16string nextDamaged() {
    std::u16string pattern = next();
    const size_t at = below(pattern.size() + 1);
    if (at == pattern.size()) return pattern;
    switch (below(4)) {
      case 0:
        return pattern.substr(0, at);
      case 1:
        return pattern.erase(at, 1);
      case 2:
        return pattern.insert(at, 1, pattern[at]);
      default:
        pattern[at] = u"{}'|#,<=0 s"[below(11)];
        return pattern;
    }
  }

 private:
  std::u16string space() { return oneOf({u"", u"", u"", u" ", u"\n", u"\u200E"}); }

  std::u16string text(char16_t kind) {
    if (kind == u'c') return oneOf({u"", u"x", u"it's ", u"''", u"'|'", u"'{0}|'", u"#", u"' "});
    return oneOf({u"", u"x", u"it's ", u"''", u"'{'", u"'}'''", u"|", u"#", u"'#'", u"'|' ",
                  u"'{0,select,other{'", u"' "});
  }

  std::u16string simple() {
    return oneOf({u"{0}", u"{ 1 }", u"{0,number}", u"{0, date ,yyyy}", u"{1,time,'}'HH'{'}",
                  u"{0,number,{}{{}}}", u"{name}", u"{0,choices,0#{}}", u"{0,pluralx}"});
  }

  std::u16string message(int levels, char16_t kind) {
    std::u16string all = text(kind) + (below(2) ? simple() : u"") + text(kind);
    if (levels > 0) all += argument(levels - 1);
    return all + text(kind);
  }

  std::u16string argument(int levels) {
    const std::u16string head = u"{" + space() + u"0" + space() + u"," + space();
    if (below(4) == 0) {
      std::u16string choice = head + oneOf({u"choice", u"Choice"}) + space() + u",";
      if (below(2)) choice += space() + u"0#" + text(u'c') + u"|";
      return choice + space() + u"1" + space() + oneOf({u"#", u"<", u"\u2264"}) +
             message(levels, u'c') + u"}";
    }
    std::u16string style = head + oneOf({u"select", u"SELECT", u"plural", u"selectordinal"}) +
                           space() + u"," + space();
    if (below(2)) style += u"few" + space() + u"{" + text(u' ') + u"}" + space();
    return style + u"other" + space() + u"{" + message(levels, u' ') + u"}" + space() + u"}";
  }
};

TEST(PatternNestingTest, TheLevelsAreThoseOfIcu) {
  Patterns patterns;
  int read[kTooDeep + 1] = {};
  for (int i = 0; i < 40000; ++i) {
    const std::u16string pattern = patterns.next();
    const Parsed parsed(pattern);
    if (!parsed.readable) continue;
    const int expected = std::min(parsed.nesting, kTooDeep);
    ASSERT_EQ(qlxPatternNesting(pattern), expected) << ::testing::PrintToString(pattern);
    ++read[expected];
  }
  for (int levels = 0; levels <= kTooDeep; ++levels) EXPECT_GT(read[levels], 100) << levels;
}

TEST(PatternNestingTest, InADamagedPatternIcuComesNoDeeper) {
  Patterns patterns;
  int refused = 0;
  for (int i = 0; i < 60000; ++i) {
    const std::u16string pattern = patterns.nextDamaged();
    const Parsed parsed(pattern);
    const int found = qlxPatternNesting(pattern), expected = std::min(parsed.nesting, kTooDeep);
    if (parsed.readable) {
      ASSERT_EQ(found, expected) << ::testing::PrintToString(pattern);
    } else {
      ASSERT_GE(found, expected) << ::testing::PrintToString(pattern);
    }
    refused += !parsed.readable;
  }
  EXPECT_GT(refused, 1000);
}

// ---- What becomes of such patterns

using Message = Owned<I18Msg, qlxIntlFreeI18Msg>;

struct Bound {
  std::u16string text;
  int error;
};

Bound bindWith(const char *bundle, const char *key, const UChar *text, ...) {
  const Message message{qlxIntlAllocUI18Msg(bundle, key, text)};
  va_list args;
  va_start(args, text);
  Bound bound{take(qlxIntlBindUI18Msg(message.get(), &args)), 0};
  va_end(args);
  bound.error = message->error;
  return bound;
}

Bound bind(const Nest &nest, int levels) {
  const std::u16string pattern = nest.at(levels);
  if (nest.leaf == kSelect.leaf) return bindWith(nullptr, nullptr, pattern.c_str(), u"x");
  return bindWith(nullptr, nullptr, pattern.c_str(), 7.0, 7.0);
}

// On a thread with the smallest stack that hosts use.
template <typename Call>
void onSmallStack(Call call) {
  pthread_attr_t attributes;
  pthread_attr_init(&attributes);
  ASSERT_EQ(pthread_attr_setstacksize(&attributes, size_t{64} * 1024), 0);
  pthread_t thread;
  const auto run = [](void *argument) -> void * {
    (*static_cast<Call *>(argument))();
    return nullptr;
  };
  ASSERT_EQ(pthread_create(&thread, &attributes, run, &call), 0);
  pthread_join(thread, nullptr);
  pthread_attr_destroy(&attributes);
}

class NestedMessageTest : public ::testing::Test {
 protected:
  void SetUp() override { qlxDropCachedFormats(); }
  void TearDown() override { qlxDropCachedFormats(); }
};

TEST_F(NestedMessageTest, EightLevelsAreFormattedOnASmallStack) {
  onSmallStack([] {
    for (const Nest &nest : kNests)
      for (int round = 0; round < 3; ++round) {
        const Bound bound = bind(nest, kMaxPatternNesting);
        EXPECT_EQ(bound.error, 0);
        EXPECT_NE(bound.text, u"<null>");
      }
  });
}

TEST_F(NestedMessageTest, MoreLevelsAreRefusedOnASmallStack) {
  for (const int levels : {9, 23, 100, 100000})
    onSmallStack([levels] {
      for (const Nest &nest : kNests) {
        const Bound bound = bind(nest, levels);
        EXPECT_EQ(bound.error, U_ILLEGAL_ARGUMENT_ERROR);
        EXPECT_EQ(bound.text, u"<null>");
      }
    });
}

TEST_F(NestedMessageTest, WhatIsOpenAtTheEndIsRefusedToo) {
  onSmallStack([] {
    for (const Nest &nest : kNests)
      EXPECT_EQ(bind({nest.begin, u"", nest.leaf}, 100000).error, U_ILLEGAL_ARGUMENT_ERROR);
  });
}

TEST_F(NestedMessageTest, ARefusedPatternTakesNoMemory) {
  const std::u16string pattern = kSelect.at(9);
  CxUStringBuff text{};
  const FailingMemory memory;
  for (int round = 0; round < 3; ++round) {
    UErrorCode status = U_ZERO_ERROR;
    EXPECT_EQ(qlxAppendCachedMessage(&text, "en", pattern.c_str(), nullptr, &status), 0U);
    EXPECT_EQ(status, U_ILLEGAL_ARGUMENT_ERROR);
  }
  EXPECT_EQ(memory.attempts(), 0U);
}

TEST_F(NestedMessageTest, ABundlesPatternIsRefusedAlike) {
  const ResourceBundles bundles{"nested"};
  const auto resource = [](const std::string &key, const std::u16string &pattern) {
    return key + " { \"" + std::string(pattern.begin(), pattern.end()) + "\" }\n";
  };
  ASSERT_TRUE(
      bundles.add("root", resource("eight", kSelect.at(8)) + resource("nine", kSelect.at(9))));
  const std::string path = bundles.path();
  for (int round = 0; round < 3; ++round) {
    EXPECT_EQ(bindWith(path.c_str(), "eight", nullptr, u"x").text, u"x");
    EXPECT_EQ(bindWith(path.c_str(), "nine", nullptr, u"x").error, U_ILLEGAL_ARGUMENT_ERROR);
    ArgTypes types;
    EXPECT_TRUE(qlxScanBundlePattern({path.c_str(), "eight", nullptr}, &types));
    EXPECT_FALSE(qlxScanBundlePattern({path.c_str(), "nine", nullptr}, &types));
  }
}

TEST_F(NestedMessageTest, TheScanOfTypesRefusesItToo) {
  ArgTypes types;
  EXPECT_TRUE(qlxScanPatternTypes((kSelect.at(8) + u"{1}").c_str(), &types));
  EXPECT_EQ(types[1], ArgType::kString);
  EXPECT_FALSE(qlxScanPatternTypes((kSelect.at(9) + u"{1}").c_str(), &types));
  EXPECT_EQ(types[1], ArgType::kNone);
}

TEST_F(NestedMessageTest, APatternIsNotTakenApartThatNestsTooDeep) {
  onSmallStack([] {
    QlxComposed composed;
    EXPECT_FALSE(qlxCompose(&composed, kSelect.at(100000), nullptr));
  });
}

}  // namespace
