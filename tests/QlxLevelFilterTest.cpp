#include "support/ChainTest.h"

namespace {

class LevelFilterTest : public ChainTest {
 protected:
  void SetUp() override {
    ChainTest::SetUp();
    filter = get("filter", "qlx_levelfilter");
    const Handle handler = get("recording", RecordingHandler::kClass);
    QlxAddListener(filter.get(), handler.get());
  }
  void TearDown() override {
    filter.reset();
    ChainTest::TearDown();
  }

  bool passes(int32_t level) {
    recorder->records.clear();
    process(filter, level);
    return recorder->records.size() == 1;
  }

  Handle filter;
};

TEST_F(LevelFilterTest, PassesEveryEventAsLongAsItHasNoThreshold) {
  EXPECT_TRUE(passes(-1));
  EXPECT_TRUE(passes(ALL));
  EXPECT_TRUE(passes(INT32_MIN));
}

TEST_F(LevelFilterTest, PassesEveryEventAtAThresholdOfZero) {
  QlxSetObjProp(filter.get(), "level", "WARN");
  QlxSetObjProp(filter.get(), "level", "ALL");
  EXPECT_TRUE(passes(-1));
}

TEST_F(LevelFilterTest, DropsWhatIsBelowTheThresholdAndPassesWhatReachesIt) {
  QlxSetObjProp(filter.get(), "level", "WARN");
  EXPECT_FALSE(passes(WARN - 1));
  EXPECT_TRUE(passes(WARN));
  EXPECT_TRUE(passes(WARN + 1));
}

TEST_F(LevelFilterTest, ReadsTheThresholdAsANumberToo) {
  QlxSetObjProp(filter.get(), "level", "4500");
  EXPECT_FALSE(passes(4499));
  EXPECT_TRUE(passes(4500));
}

TEST_F(LevelFilterTest, PassesAnEventWithoutLevelAtAnyThreshold) {
  QlxSetObjProp(filter.get(), "level", "OFF");
  EXPECT_TRUE(passes(UNSPECIFIED));
  EXPECT_FALSE(passes(FATAL));
}

TEST_F(LevelFilterTest, PassesEverythingWhenItsLevelIsMisspelt) {
  QlxSetObjProp(filter.get(), "level", "LOUD");
  EXPECT_TRUE(passes(DEBUG_MAX));
}

TEST_F(LevelFilterTest, PassesEverythingWhenTheKeyChangesWithoutAValue) {
  QlxSetObjProp(filter.get(), "level", "OFF");
  const ApiLock lock;
  qlxIntlStringToStringMapRem(filter->props, "level");
  QlxLevelFilterFCfgChange(filter.get(), "level");
  EXPECT_EQ(loadLevel(filter.get()), UNSPECIFIED);
}

TEST_F(LevelFilterTest, TakesItsKeyOnlyInLowerCase) {
  QlxSetObjProp(filter.get(), "LEVEL", "OFF");
  EXPECT_TRUE(passes(INFO));
}

TEST_F(LevelFilterTest, HandsOtherKeysToTheOnesThatAllObjectsShare) {
  QlxSetObjProp(filter.get(), "logging", "off");
  EXPECT_FALSE(passes(FATAL));
  QlxSetObjProp(filter.get(), "listenerNames", "");
  EXPECT_EQ(QlxGetListeners(filter.get()), nullptr);
}

TEST_F(LevelFilterTest, PassesNothingOnWhileItIsDisabled) {
  QlxSetObjectEnabled(filter.get(), 0);
  EXPECT_FALSE(passes(FATAL));
  QlxSetObjectEnabled(filter.get(), 1);
  EXPECT_TRUE(passes(FATAL));
}

TEST_F(LevelFilterTest, HandsTheEventAndTheArgumentsOnAsTheyAre) {
  QlxAddListener(logger.get(), filter.get());
  QlxLogUText(logger.get(), u"{0}!", u"hello");
  EXPECT_RECORDED(u"hello!|");
  EXPECT_NE(recorder->records[0].args, nullptr);
}

TEST_F(LevelFilterTest, IsAskedWithoutALogCall) {
  QlxSetObjProp(filter.get(), "level", "ERROR");
  Event *event = QlxVaAllocUEvent(WARN, nullptr, nullptr, u"");
  EXPECT_EQ(QlxIsLoggableByFilter(filter.get(), event, nullptr), 0);
  event->level = ERROR;
  EXPECT_EQ(QlxIsLoggableByFilter(filter.get(), event, nullptr), 1);
  QlxFreeEvent(event);
}

TEST_F(LevelFilterTest, SaysNoWithoutFilterOrEvent) {
  Event *event = QlxVaAllocUEvent(FATAL, nullptr, nullptr, u"");
  EXPECT_EQ(QlxLevelFilterFIsLoggable(nullptr, event, nullptr), 0);
  EXPECT_EQ(QlxLevelFilterFIsLoggable(filter.get(), nullptr, nullptr), 0);
  QlxFreeEvent(event);
}

TEST_F(LevelFilterTest, IgnoresNull) {
  QlxLevelFilterFCfgChange(nullptr, "level");
  QlxLevelFilterFCfgChange(filter.get(), nullptr);
  QlxBasicFilterFProcess(nullptr, nullptr, nullptr);
  QlxBasicFilterFProcess(filter.get(), nullptr, nullptr);
  EXPECT_RECORDED(u"");
}

// ---- The step that other filter classes share

static int answer;       // of the asking class
static Event *lastSeen;  // by it
static int logged;       // calls of the class's own log operation

static uint8_t answerAsTold(QlxObject *, Event *event, va_list *) {
  lastSeen = event;
  return static_cast<uint8_t>(answer);
}

static void countLogged(QlxObject *, Event *, va_list *) {
  ++logged;
}

TEST_F(LevelFilterTest, AHostsFilterPassesOnlyWhenItSaysExactlyOne) {
  QlxAddFilterClass("test_filter", nullptr, nullptr, nullptr, nullptr, nullptr, answerAsTold,
                    countLogged);
  const Handle own = get("own", "test_filter");
  for (int said : {0, 2, 255}) {
    answer = said;
    logged = 0;
    process(own, INFO);
    EXPECT_EQ(logged, 0) << said;
  }
  answer = 1;
  process(own, INFO);
  EXPECT_EQ(logged, 1);
}

TEST_F(LevelFilterTest, AHostsFilterIsNotAskedWhileItIsDisabled) {
  QlxAddFilterClass("test_filter", nullptr, nullptr, nullptr, nullptr, nullptr, answerAsTold,
                    countLogged);
  const Handle own = get("own", "test_filter");
  QlxSetObjectEnabled(own.get(), 0);
  answer = 1;
  logged = 0;
  lastSeen = nullptr;
  process(own, INFO);
  EXPECT_EQ(logged, 0);
  EXPECT_EQ(lastSeen, nullptr);
}

TEST_F(LevelFilterTest, AHostsFilterWithoutATestOfItsOwnHasTheThreshold) {
  QlxAddFilterClass("test_filter", nullptr, nullptr, nullptr, QlxLevelFilterFCfgChange, nullptr,
                    nullptr, countLogged);
  const Handle own = get("own", "test_filter");
  QlxSetObjProp(own.get(), "level", "ERROR");
  logged = 0;
  process(own, WARN);
  EXPECT_EQ(logged, 0);
  process(own, ERROR);
  EXPECT_EQ(logged, 1);
}

TEST_F(LevelFilterTest, TheSharedStepWantsAFilterWithBothOperations) {
  const Handle handler = get("recording2", RecordingHandler::kClass);
  QlxBasicFilterFProcess(handler.get(), nullptr, nullptr);

  ObjClass broken = *filter->objClass;
  ObjClass *real = filter->objClass;
  filter->objClass = &broken;
  broken.op2.fIsLoggable = nullptr;
  EXPECT_FALSE(passes(FATAL));
  broken.op2 = real->op2;
  broken.op3.fLog = nullptr;
  EXPECT_FALSE(passes(FATAL));
  broken.op3 = real->op3;
  broken.kind = Logger;
  EXPECT_FALSE(passes(FATAL));
  broken.kind = Filter;
  EXPECT_TRUE(passes(FATAL));
  filter->objClass = real;
}

}  // namespace
