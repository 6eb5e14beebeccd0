#include <qlx/class/logger.h>

#include <unistd.h>

#include <array>
#include <cstring>
#include <map>
#include <optional>
#include <set>
#include <utility>

#include "record/QlxFormatted.h"
#include "text/QlxFormatCache.h"
#include "record/QlxLoggedEvent.h"
#include "record/QlxCachedBuffer.h"
#include "support/HostName.h"
#include "support/ChainTest.h"
#include "support/FailingMemory.h"
#include "support/Status.h"
#include "support/Together.h"

namespace {

constexpr const char *kStamped[] = {"organization", "product",      "component",      "client",
                                    "server",       "serverFormat", "productInstance"};

class PDLoggerTest : public ChainTest {
 protected:
  void SetUp() override {
    ChainTest::SetUp();
    madeUpName = "alpha.example.org";
    recorder->alsoDo = [this](Event *event) { seen = Seen(event); };
    logger = listened("pd");
  }
  void TearDown() override {
    ChainTest::TearDown();
    madeUpName = nullptr;
    madeUpOfficialName.clear();
  }

  // What an event was when it reached the handler.
  struct Seen {
    Seen() = default;
    explicit Seen(const Event *event) : messageId(event->messageId ? event->messageId : "<null>") {
      for (const auto *it = event->props ? event->props->head : nullptr; it; it = it->next) {
        keys += std::string(it->key) + "|";
        all += std::string(it->key) + "=" + it->value + "|";
      }
    }
    std::string keys, all;  // in order, each with "|" behind it
    std::string messageId;
  };

  // A logger of the class with a handler below it.
  Handle listened(const char *name) { return listened(get(name, "qlx_pdlogger")); }
  Handle listened(Handle made) {
    const Handle handler = get("recording", RecordingHandler::kClass);
    QlxAddListener(made.get(), handler.get());
    return made;
  }

  void set(const char *key, const char *value) {
    EXPECT_EQ(QlxSetObjProp(logger.get(), key, value), 1);
  }

  void clear(const char *key) { ToolkitTest::clear(logger, key); }

  // What an event carries that was logged just now.
  const Seen &logged(const char16_t *text = u"text") {
    seen = {};
    QlxLogUText(logger.get(), text);
    return seen;
  }

  static std::string whereItRuns() {
    return "processId=" + std::to_string(getpid()) +
           "|threadId=" + std::to_string(static_cast<int32_t>(CxThreadGetCurrentID())) + "|";
  }

  Seen seen;
};

// ---- What is stamped

TEST_F(PDLoggerTest, WithoutConfigurationItStampsHostFormatProcessAndThread) {
  EXPECT_EQ(logged().all, "server=alpha.example.org|serverFormat=IP|" + whereItRuns());
}

TEST_F(PDLoggerTest, StampsAllItsValuesInTheirOrder) {
  for (size_t i = std::size(kStamped); i-- > 0;) set(kStamped[i], kStamped[i]);
  EXPECT_EQ(logged().all,
            "organization=organization|product=product|component=component|client=client|"
            "server=server|serverFormat=serverFormat|productInstance=productInstance|" +
                whereItRuns());
}

TEST_F(PDLoggerTest, StampsAValueFromWhenItIsSetUntilItIsCleared) {
  const std::string before = logged().all;
  set("product", "Quill");
  EXPECT_EQ(logged().all, "product=Quill|" + before);
  EXPECT_EQ(logged().all, "product=Quill|" + before);
  set("product", "Other");
  EXPECT_EQ(logged().all, "product=Other|" + before);
  clear("product");
  EXPECT_EQ(logged().all, before);
}

TEST_F(PDLoggerTest, AValueThatIsSetToNothingIsNotStamped) {
  set("product", "Quill");
  set("product", nullptr);
  EXPECT_EQ(logged().keys, "server|serverFormat|processId|threadId|");
}

TEST_F(PDLoggerTest, StampsAnEmptyValue) {
  set("product", "");
  EXPECT_EQ(logged().all.find("product=|"), 0u);
}

TEST_F(PDLoggerTest, LosesTheDefaultsOfAValueThatIsTakenAway) {
  set("server", "beta");
  clear("server");
  clear("serverFormat");
  EXPECT_EQ(logged().all, whereItRuns());
}

TEST_F(PDLoggerTest, TakesItsKeysOnlyAsTheyAreWritten) {
  set("Product", "Quill");
  set("SERVER", "beta");
  EXPECT_EQ(logged().all, "server=alpha.example.org|serverFormat=IP|" + whereItRuns());
}

TEST_F(PDLoggerTest, IsConfiguredByItsConfiguration) {
  configure("configured", "className", "qlx_pdlogger");
  configure("configured", "component", "Copier");
  configure("configured", "level", "ALL");
  logger = get("configured");
  const Handle handler = get("recording", RecordingHandler::kClass);
  QlxAddListener(logger.get(), handler.get());
  EXPECT_EQ(logged().keys, "component|server|serverFormat|processId|threadId|");
  EXPECT_EQ(QlxIsLoggable(logger.get(), DEBUG_MAX), 1);
}

// Logs an event that has been given properties before, as a chain of a host's own would.
TEST_F(PDLoggerTest, ReplacesTheValuesThatAnEventHas) {
  set("product", "Quill");
  const ApiLock lock;
  Event *event = QlxVaAllocUEvent(INFO, nullptr, nullptr, u"text");
  for (const char *key : {"threadId", "product", "client", "server"}) {
    QlxSetEventProp(event, key, "own");
  }
  QlxPDLoggerFLog(logger.get(), event, nullptr);
  const std::string thread =
      std::to_string(static_cast<int32_t>(QlxGetEventPropLong(event, "threadId", nullptr)));
  EXPECT_EQ(thread, std::to_string(static_cast<int32_t>(CxThreadGetCurrentID())));
  EXPECT_EQ(seen.keys, "threadId|product|client|server|serverFormat|processId|");
  EXPECT_EQ(take(QlxGetEventProp(event, "product", nullptr)), "Quill");
  EXPECT_EQ(take(QlxGetEventProp(event, "client", nullptr)), "own");  // it has none to stamp
  EXPECT_EQ(take(QlxGetEventProp(event, "server", nullptr)), "alpha.example.org");
  QlxFreeEvent(event);
}

TEST_F(PDLoggerTest, TwoLoggersStampValuesOfTheirOwn) {
  set("product", "one");
  const Handle first = std::move(logger);
  logger = listened("second");
  set("product", "two");
  EXPECT_EQ(logged().all.find("product=two|"), 0u);
  logger = get("pd");
  EXPECT_EQ(logged().all.find("product=one|"), 0u);
}

TEST_F(PDLoggerTest, EachThreadStampsItsOwnNumberAndWholeValuesWhileTheyChange) {
  constexpr int kCalls = 200;
  std::map<int32_t, int> counts;  // by thread
  recorder->alsoDo = [&counts](Event *event) {
    ++counts[QlxGetEventPropLong(event, "threadId", nullptr)];
    const std::string product = take(QlxGetEventProp(event, "product", nullptr));
    EXPECT_TRUE(product == "<null>" || product == "Quill" || product == "a longer one") << product;
  };
  std::array<int32_t, 2> threads{};
  const auto logAll = [this](int32_t *thread) {
    *thread = static_cast<int32_t>(CxThreadGetCurrentID());
    for (int i = 0; i < kCalls; ++i) QlxLogUText(logger.get(), u"text");
  };
  const auto changeAll = [this] {
    for (int i = 0; i < kCalls; ++i) {
      for (const char *value : {"Quill", static_cast<const char *>(nullptr), "a longer one"}) {
        set("product", value);
      }
    }
  };
  together([&] { logAll(&threads[0]); }, [&] { logAll(&threads[1]); }, changeAll);
  EXPECT_EQ(counts.size(), threads.size());
  for (const int32_t thread : threads) EXPECT_EQ(counts[thread], kCalls);
}

// ---- The host's name

TEST_F(PDLoggerTest, StampsNoHostnameForAHostWithoutOne) {
  madeUpName = "";
  logger = listened("nameless");
  EXPECT_EQ(logged().all, "server=NO_HOSTNAME|serverFormat=IP|" + whereItRuns());
}

TEST_F(PDLoggerTest, StampsNoHostnameForANameThatDoesNotResolve) {
  madeUpName = "short";
  logger = listened("unresolved");
  EXPECT_EQ(logged().all.find("server=NO_HOSTNAME|"), 0u);
}

TEST_F(PDLoggerTest, StampsTheOfficialNameOfAHostThatHasAShortOne) {
  madeUpName = "short";
  madeUpOfficialName = "short.example.org";
  logger = listened("resolved");
  EXPECT_EQ(logged().all.find("server=short.example.org|"), 0u);
}

TEST_F(PDLoggerTest, CutsAnOfficialNameAt256Characters) {
  madeUpName = "short";
  madeUpOfficialName = "short." + std::string(300, 'x');
  logger = listened("long");
  EXPECT_EQ(logged().all.find("server=" + madeUpOfficialName.substr(0, 256) + "|"), 0u);
}

TEST_F(PDLoggerTest, LearnsTheHostsNameOnceWhenItIsMade) {
  madeUpName = "beta.example.org";
  EXPECT_EQ(logged().all.find("server=alpha.example.org|"), 0u);
}

// ---- The message identifier

TEST_F(PDLoggerTest, StoresTheIdentifierThatTheTextStartsWith) {
  EXPECT_EQ(logged(u"ABC0001E wrong").messageId, "ABC0001E");
  EXPECT_EQ(logged(u"wrong: ABC0001E").messageId, "");
  EXPECT_EQ(logged(u"").messageId, "");
}

TEST_F(PDLoggerTest, ReadsTheIdentifierOffTheBoundText) {
  QlxLogUText(logger.get(), u"{0}0001E wrong", u"ABC");
  EXPECT_EQ(seen.messageId, "ABC0001E");
  EXPECT_RECORDED(u"ABC0001E wrong|");  // the arguments are there for the formatter too
}

TEST_F(PDLoggerTest, AnEventKeepsTheIdentifierItHas) {
  const ApiLock lock;
  for (const char *id : {"XYZ0002W", "anything", ""}) {
    Event *event = QlxVaAllocUEvent(INFO, nullptr, nullptr, u"ABC0001E wrong");
    QlxSetEventMessageId(event, id);
    QlxPDLoggerFLog(logger.get(), event, nullptr);
    EXPECT_EQ(seen.messageId, id);
    QlxFreeEvent(event);
  }
}

TEST_F(PDLoggerTest, ABindThatFailsShowsInTheResultAlsoWithoutListeners) {
  const Handle lonely = get("lonely", "qlx_pdlogger");
  const QlxLogResult failed = QlxLogInfo(lonely.get(), "/no/such/bundle", "key");
  EXPECT_EQ(failed, (QlxLogResult{'-', 0, U_MISSING_RESOURCE_ERROR}));
  EXPECT_EQ(QlxLogUText(lonely.get(), u"text"), (QlxLogResult{'-', 0, 0}));
  const Handle basic = get("basic", "qlx_basiclogger");  // which leaves binding to its listeners
  EXPECT_EQ(QlxLogInfo(basic.get(), "/no/such/bundle", "key"), (QlxLogResult{'-', 0, 0}));
}

// ---- As a logger

TEST_F(PDLoggerTest, HasTheThresholdOfABasicLogger) {
  EXPECT_EQ(QlxIsLoggable(logger.get(), DEBUG_MIN), 1);
  EXPECT_EQ(QlxIsLoggable(logger.get(), DEBUG_MID), 0);
  set("level", "ERROR");
  EXPECT_EQ(QlxIsLoggable(logger.get(), WARN), 0);
  EXPECT_EQ(QlxIsLoggable(logger.get(), ERROR), 1);
}

TEST_F(PDLoggerTest, HandsOtherKeysToTheOnesThatAllObjectsShare) {
  set("logging", "off");
  EXPECT_EQ(logged().all, "");
  set("logging", "on");
  EXPECT_NE(logged().all, "");
  set("listenerNames", "");
  EXPECT_EQ(QlxGetListeners(logger.get()), nullptr);
}

TEST_F(PDLoggerTest, ACallBelowTheThresholdIsNeitherBoundNorPassedOn) {
  set("level", "ERROR");
  const FailingMemory memory;
  EXPECT_EQ(QlxLogInfo(logger.get(), "/no/such/bundle", "key"), (QlxLogResult{'-', 0, 0}));
  EXPECT_EQ(memory.attempts(), 0u);  // no event was made
  EXPECT_RECORDED(u"");
  QlxLogError(logger.get(), "/no/such/bundle", "key");
  EXPECT_EQ(recorder->records.size(), 1u);
}

TEST_F(PDLoggerTest, HandsTheArgumentsOnAsTheyAre) {
  QlxLogError(logger.get(), nullptr, nullptr, 1);
  EXPECT_NE(recorder->records.at(0).args, nullptr);
}

TEST_F(PDLoggerTest, ADisabledLoggerStampsButPassesNothingOn) {
  QlxSetObjectEnabled(logger.get(), 0);
  const ApiLock lock;
  Event *event = QlxVaAllocUEvent(INFO, nullptr, nullptr, u"ABC0001E wrong");
  QlxPDLoggerFLog(logger.get(), event, nullptr);
  EXPECT_EQ(Seen(event).keys, "server|serverFormat|processId|threadId|");
  EXPECT_RECORDED(u"");
  QlxFreeEvent(event);
}

TEST_F(PDLoggerTest, LogsNothingWithoutLoggerOrEvent) {
  const ApiLock lock;
  Event *event = QlxVaAllocUEvent(INFO, nullptr, nullptr, u"ABC0001E wrong");
  QlxPDLoggerFLog(nullptr, event, nullptr);
  EXPECT_EQ(event->props, nullptr);
  EXPECT_EQ(event->messageId, nullptr);
  QlxPDLoggerFLog(logger.get(), nullptr, nullptr);
  EXPECT_RECORDED(u"");
  QlxFreeEvent(event);
}

TEST_F(PDLoggerTest, IgnoresNull) {
  {
    const ApiLock lock;
    QlxPDLoggerFFreeVars(nullptr);
    QlxPDLoggerFCfgChange(nullptr, "server");
    QlxPDLoggerFCfgChange(logger.get(), nullptr);
  }
  EXPECT_EQ(logged().keys, "server|serverFormat|processId|threadId|");
}

TEST_F(PDLoggerTest, WithoutVariablesItStampsWhereItRunsAndLogsOn) {
  logger = listened(getWithoutVariables("without", "qlx_pdlogger"));
  set("product", "Quill");
  EXPECT_EQ(logged(u"ABC0001E wrong").all, whereItRuns());
  EXPECT_EQ(seen.messageId, "ABC0001E");
}

TEST_F(PDLoggerTest, WithoutVariablesTheKeysOfTheBasicLoggerStillCount) {
  logger = getWithoutVariables("without", "qlx_pdlogger");
  set("level", "WARN");
  EXPECT_EQ(logger->kind1.level, WARN);
  set("logging", "off");
  EXPECT_EQ(QlxIsObjectEnabled(logger.get()), 0);
}

// ---- Without memory

// A first listener: what the event was when it came.
struct Arrival {
  static constexpr const char *kClass = "test_arrival";
  static inline std::optional<CxStatus> status;  // nothing: no event came
  static inline std::string event;

  static void process(QlxObject *, Event *arrived, va_list *) {
    status = arrived->status;
    event = arrived->messageId ? arrived->messageId : "<null>";
    event += arrived->message && arrived->message->text ? " text|" : " no text|";
    for (const auto *it = arrived->props ? arrived->props->head : nullptr; it; it = it->next) {
      event += std::string(it->key) + "=" + (it->value ? it->value : "<null>") + "|";
    }
  }
};

TEST_F(PDLoggerTest, WhateverFindsNoMemoryBeforeTheFirstListenerIsTold) {
  QlxAddHandlerClass(Arrival::kClass, nullptr, nullptr, nullptr, nullptr, Arrival::process, nullptr,
                     nullptr);
  const Handle first = get("pd first", "qlx_pdlogger"), handler = get("arrival", Arrival::kClass);
  QlxAddListener(first.get(), handler.get());
  for (const char *key : kStamped) QlxSetObjProp(first.get(), key, "some value of its own");
  const auto log = [&first] {
    Arrival::status.reset();
    const QlxLogResult result =
        QlxLogDebugMin(first.get(), "file", "function", 1, u"ABC0001E '{'wrong'}'");
    return CxStatus{result.statusKind, result.statusCode};
  };
  FailingMemory memory;
  int told = 0;
  for (const bool isFirstCall : {true, false})
    for (const auto fail : {&FailingMemory::failOnce, &FailingMemory::failFrom})
      for (uint64_t nth = 1, failures = 1; failures > 0; ++nth) {
        EXPECT_EQ(log(), kSuccess);
        const std::string whole = Arrival::event;
        if (isFirstCall) qlxDropCachedEvent();
        qlxDropCachedFormats();
        qlxDropCachedBuffers();
        (memory.*fail)(nth);
        const CxStatus status = log();
        failures = memory.failures();
        memory.failNone();
        if (status == failure(ENOMEM)) {
          ++told;
          EXPECT_EQ(Arrival::status.value_or(status), status) << nth;
          EXPECT_GT(failures, 0U);
        } else {
          EXPECT_EQ(status, kSuccess);
          EXPECT_EQ(Arrival::status, kSuccess) << nth;
          EXPECT_EQ(Arrival::event, whole) << nth;
        }
      }
  EXPECT_GT(told, 40);
}

// ---- The formatter that all loggers of the class share

TEST_F(PDLoggerTest, TwoLoggersHoldTheirFormatterAtThree) {
  constexpr const char *kName = "quill.pdMsgIdFormatter";
  Handle held = get(kName);
  QlxObject *const formatter = held.get();
  held.reset();  // the logger keeps it
  ASSERT_NE(formatter, nullptr);
  EXPECT_STREQ(formatter->objClass->name, "qlx_xmlformatter");
  EXPECT_EQ(formatter->refCount, 2u);
  const Handle second = get("second", "qlx_pdlogger");
  EXPECT_EQ(formatter->refCount, 3u);
  logger.reset();
  EXPECT_EQ(get(kName).get(), formatter);
  EXPECT_EQ(formatter->refCount, 2u);
}

TEST_F(PDLoggerTest, TheFormatterIsGoneAfterTheLastAndMadeAnewForTheNext) {
  logger.reset();
  EXPECT_EQ(get("quill.pdMsgIdFormatter"), nullptr);
  logger = listened("pd");
  EXPECT_NE(get("quill.pdMsgIdFormatter"), nullptr);
  EXPECT_EQ(logged(u"ABC0001E wrong").messageId, "ABC0001E");
}

TEST_F(PDLoggerTest, AnObjectOfAnotherClassInTheFormattersPlaceStaysAndTheLoggerWorks) {
  logger.reset();
  const Handle other = get("quill.pdMsgIdFormatter", "qlx_levelfilter");
  logger = listened("pd");
  EXPECT_EQ(logged(u"ABC0001E wrong").messageId, "ABC0001E");
  EXPECT_EQ(other->refCount, 2u);
}

// The logger that is asked for makes the formatter of that name before it is registered itself.
TEST_F(PDLoggerTest, CannotHaveTheNameOfItsFormatter) {
  constexpr const char *kName = "quill.pdMsgIdFormatter";
  logger.reset();
  {
    const FailingMemory memory;
    EXPECT_EQ(get(kName, "qlx_pdlogger"), nullptr);
    EXPECT_EQ(get(kName), nullptr);  // gone with the only one that held it
    EXPECT_EQ(memory.live(), 0);
  }
  logger = listened("pd");
  const Handle formatter = get(kName);
  EXPECT_EQ(get(kName, "qlx_pdlogger"), nullptr);
  EXPECT_EQ(formatter->refCount, 3u);  // registry, logger, test
  EXPECT_EQ(logged(u"ABC0001E wrong").messageId, "ABC0001E");
}

// Closing frees the variables of all objects first, which here changes the registry it walks.
TEST_F(PDLoggerTest, ClosingGivesAllOfSeveralLoggersAndFiltersBack) {
  const Handle filters[] = {get("f1", "qlx_msgidfilter"), get("f2", "qlx_msgidfilter")};
  const Handle second = get("a", "qlx_pdlogger");
  for (const Handle &filter : filters) QlxAddListener(logger.get(), filter.get());
  QlxCloseToolkit();
  EXPECT_EQ(logger->refCount, 1u);
  EXPECT_EQ(logger->objClass, nullptr);
  EXPECT_EQ(logger->vars, nullptr);
  ASSERT_EQ(QlxOpenToolkit(nullptr, nullptr), 1);
  EXPECT_EQ(get("quill.pdMsgIdFormatter"), nullptr);
  EXPECT_EQ(get("msgFormatter"), nullptr);
}

TEST_F(PDLoggerTest, AllItsMemoryIsGivenBackWhenItIsReleased) {
  logger.reset();  // the configuration of its name stays
  const FailingMemory memory;
  {
    const Handle made = get("pd", "qlx_pdlogger");
    for (const char *key : kStamped) QlxSetObjProp(made.get(), key, "value");
    QlxLogInfo(made.get(), nullptr, nullptr);
    EXPECT_GT(memory.live(), 0);
  }
  qlxDropCachedEvent();  // what is kept for the next call
  qlxDropCachedBuffers();
  EXPECT_EQ(memory.live(), 0);
}

TEST_F(PDLoggerTest, WhatFindsNoMemoryIsNotStamped) {
  std::set<std::string> stamped;
  bool failed = true;
  for (uint64_t n = 1; failed; ++n) {
    logger.reset();
    {
      FailingMemory memory;
      memory.failOnce(n);
      logger = get("made", "qlx_pdlogger");
      failed = memory.failures() > 0;
    }
    if (!logger) continue;
    logger = listened(std::move(logger));
    stamped.insert(logged().all);
  }
  const std::string server = "server=alpha.example.org|", format = "serverFormat=IP|";
  EXPECT_EQ(stamped, (std::set{server + format + whereItRuns(), server + whereItRuns(),
                               format + whereItRuns(), whereItRuns()}));
}

}  // namespace
