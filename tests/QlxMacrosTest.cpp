#include <qlx/macros.h>

#include <cstring>
#include <string>

#include "support/ChainTest.h"

namespace {

class MacrosTest : public ChainTest {
 protected:
  void SetUp() override {
    ChainTest::SetUp();
    attach("recording", RecordingHandler::kClass);
    recorder->alsoDo = [this](Event *event) {
      file = take(QlxGetEventProp(event, "qlx_prop_srcfile", nullptr));
      function = take(QlxGetEventProp(event, "qlx_prop_srcfunction", nullptr));
      line = QlxGetEventPropInt(event, "qlx_prop_srcline", nullptr);
      bundle = event->message->bundle ? event->message->bundle : "<null>";
      key = event->message->key ? event->message->key : "<null>";
    };
  }

  void setLevel(const char *level) { QlxSetObjProp(logger.get(), "level", level); }

  QlxObject *counted() {
    ++loggers;
    return logger.get();
  }
  const UChar *text() {
    ++arguments;
    return u"{0}";
  }
  const char *name() {
    ++arguments;
    return "name";
  }
  const UChar *value() {
    ++arguments;
    return u"value";
  }

  // Each of the seven, with all arguments counted.
  void logAll() {
    QLX_DEBUG_MIN(counted(), text(), value());
    QLX_DEBUG_MID(counted(), text(), value());
    QLX_DEBUG_MAX(counted(), text(), value());
    QLX_INFO(counted(), name(), name(), value());
    QLX_WARN(counted(), name(), name(), value());
    QLX_ERROR(counted(), name(), name(), value());
    QLX_FATAL(counted(), name(), name(), value());
  }

  std::string levels() const {
    std::string all;
    for (const auto &record : recorder->records) all += std::to_string(record.level) + "|";
    return all;
  }
  static std::string levelsFrom(size_t first) {
    const int all[] = {DEBUG_MAX, DEBUG_MID, DEBUG_MIN, INFO, WARN, ERROR, FATAL};
    const int order[] = {DEBUG_MIN, DEBUG_MID, DEBUG_MAX, INFO, WARN, ERROR, FATAL};
    std::string text;
    for (const int level : order)
      if (level >= all[first]) text += std::to_string(level) + "|";
    return text;
  }

  int loggers = 0, arguments = 0;
  std::string file, function, bundle, key;
  int line = 0;
};

TEST_F(MacrosTest, EvaluateOnlyTheLoggerOfASuppressedCallAndItOnce) {
  setLevel("FATAL");
  storeLevel(logger.get(), FATAL + 1);
  logAll();
  EXPECT_EQ(loggers, 7);
  EXPECT_EQ(arguments, 0);
  EXPECT_TRUE(recorder->records.empty());
}

TEST_F(MacrosTest, EvaluateEveryArgumentOfACallOnce) {
  setLevel("DEBUG_MAX");
  logAll();
  EXPECT_EQ(loggers, 7);
  EXPECT_EQ(arguments, 3 * 2 + 4 * 3);
  EXPECT_EQ(levels(), levelsFrom(0));
}

TEST_F(MacrosTest, LogAtTheLevelsThatTheFunctionsDo) {
  const char *const words[] = {"DEBUG_MAX", "DEBUG_MID", "DEBUG_MIN", "INFO",
                               "WARN",      "ERROR",     "FATAL"};
  for (size_t i = 0; i < std::size(words); ++i) {
    setLevel(words[i]);
    recorder->records.clear();
    logAll();
    EXPECT_EQ(levels(), levelsFrom(i)) << words[i];
  }
}

TEST_F(MacrosTest, LogEverythingWithoutAThresholdAndNothingWhenDisabled) {
  storeLevel(logger.get(), UNSPECIFIED);
  logAll();
  EXPECT_EQ(levels(), levelsFrom(0));
  arguments = 0;
  recorder->records.clear();
  QlxSetObjectEnabled(logger.get(), 0);
  logAll();
  EXPECT_EQ(levels(), "");
  EXPECT_EQ(arguments, 0);
}

TEST_F(MacrosTest, DecideInPlaceAsTheFunctionDoes) {
  constexpr int32_t kLevels[] = {
      INT32_MIN, UNSPECIFIED - 1, UNSPECIFIED, UNSPECIFIED + 1, -1,    ALL,
      DEBUG_MAX, INFO - 1,        INFO,        INFO + 1,        FATAL, INT32_MAX};
  for (const uint8_t enabled : {1, 0}) {
    QlxSetObjectEnabled(logger.get(), enabled);
    for (const int32_t threshold : kLevels) {
      storeLevel(logger.get(), threshold);
      for (const int32_t level : kLevels) {
        EXPECT_EQ(qlxIsLoggableInPlace(logger.get(), level), QlxIsLoggable(logger.get(), level))
            << level << " against " << threshold;
      }
    }
  }
  EXPECT_EQ(qlxIsLoggableInPlace(nullptr, FATAL), 0);
}

TEST_F(MacrosTest, LogNothingToANullLogger) {
  QLX_INFO(nullptr, name(), name());
  QLX_DEBUG_MIN(static_cast<QlxObject *>(nullptr), text());
  EXPECT_EQ(arguments, 0);
}

TEST_F(MacrosTest, TellWhereADebugCallStands) {
  setLevel("DEBUG_MAX");
  for (int which = 0; which < 3; ++which) {
    const int before = __LINE__;
    if (which == 0) QLX_DEBUG_MIN(logger.get(), u"text");
    if (which == 1) QLX_DEBUG_MID(logger.get(), u"text");
    if (which == 2) QLX_DEBUG_MAX(logger.get(), u"text");
    EXPECT_EQ(file, __FILE__);
    EXPECT_EQ(function, "TestBody");
    EXPECT_EQ(line, before + 1 + which);
  }
}

TEST_F(MacrosTest, BindTheirArguments) {
  setLevel("DEBUG_MAX");
  QLX_DEBUG_MIN(logger.get(), u"{0} of {1,number,integer}", u"one", 2);
  EXPECT_RECORDED(u"one of 2|");
  QLX_INFO(logger.get(), "bundle", "key");
  EXPECT_EQ(bundle + " " + key, "bundle key");
  EXPECT_EQ(file, "<null>");
}

TEST_F(MacrosTest, AreOneStatement) {
  storeLevel(logger.get(), INFO);
  for (const bool chosen : {true, false}) {
    if (chosen)
      QLX_WARN(logger.get(), "bundle", "yes");
    else
      QLX_WARN(logger.get(), "bundle", "no");
    EXPECT_EQ(key, chosen ? "yes" : "no");
  }
  if (logger.get() == nullptr)
    QLX_DEBUG_MIN(logger.get(), u"text");
  else
    key = "else of the outer if";
  EXPECT_EQ(key, "else of the outer if");
}

}  // namespace
