// Every allocation of a log call fails once, alone and with all after it: a call that answers
// success has its whole record in the file, by each formatter, and a record that a handler lost is
// counted.
#include <gtest/gtest.h>

#include <regex>
#include <string>

#include <qlx/class/formatter.h>
#include <qlx/class/handler.h>
#include <qlx/qlx.h>

#include "record/QlxFormatted.h"
#include "text/QlxFormatCache.h"
#include "record/QlxLoggedEvent.h"
#include "record/QlxCachedBuffer.h"
#include "support/FailingMemory.h"
#include "support/IcuDefaults.h"
#include "support/ResourceBundles.h"
#include "support/TempDir.h"

namespace {

constexpr const char *kFormatters[] = {"qlx_basicformatter", "qlx_xmlformatter",
                                       "qlx_vextraceformatter"};
constexpr const char *kLoggers[] = {"qlx_basiclogger", "qlx_pdlogger"};

// Longer than the line of bytes in which a record is put together first.
const std::u16string kLong(3000, u'x');

class IncompleteRecordTest : public ::testing::Test {
 protected:
  using Call = QlxLogResult (*)(QlxObject *logger, const char *bundle);

  void SetUp() override {
    ASSERT_TRUE(bundles_.add("root", R"(
      copied { "ABC0001E {1,number,integer} files from {0}, {2,number} \u00e9" }
    )"));
    ASSERT_TRUE(bundles_.add("de", R"(
      copied { "ABC0001E {1,number,integer} Dateien von {0}, {2,number} \u00e9" }
    )"));
  }

  std::string config(const char *logger, const char *formatter) const {
    return dir_.write("app.properties", std::string("app.className=") + logger +
                                            "\napp.level=ALL\napp.organization=\\u00e9\n"
                                            "app.server=host\napp.listenerNames=file\n"
                                            "file.className=qlx_filehandler\n"
                                            "file.formatterName=text\nfile.fileName=" +
                                            dir_.path("app.log") + "\ntext.className=" + formatter +
                                            "\ntext.dateTimeFormat=yyyy\ntext.locale=de\n");
  }

  // The file's text but for the milliseconds, which it takes from the file.
  std::string record() const {
    const std::string text = dir_.read("app.log");
    std::filesystem::resize_file(dir_.path("app.log"), 0);
    return std::regex_replace(std::regex_replace(text, std::regex(R"(Millis="\d+")"), ""),
                              std::regex(R"(\d\d\d\d-\d\d-\d\d \d\d:\d\d:\d\d\.\d\d\d)"), "");
  }

  static uint64_t recordsLost() {
    QlxHandlerProblems problems;
    qlxIntlGetHandlerProblems(&problems);
    return problems.recordsLost;
  }

  static bool isSuccess(const QlxLogResult &result) {
    return result.statusKind == '-' && result.msgStatus == 0;
  }

  void expectEvery(QlxObject *logger, Call call, bool isCold) const {
    const std::string bundle = bundles_.path();
    call(logger, bundle.c_str());
    record();
    const auto cool = [&] {
      if (!isCold) return;
      qlxDropCachedFormats();
      qlxDropCachedEvent();
      qlxDropCachedBuffers();
    };
    ASSERT_TRUE(isSuccess(call(logger, bundle.c_str())));
    const std::string whole = record();
    FailingMemory memory;
    for (const auto plan : {&FailingMemory::failOnce, &FailingMemory::failFrom}) {
      bool handlerHadIt = false;
      for (uint64_t n = 1, failures = 1; failures > 0; ++n) {
        SCOPED_TRACE(n);
        const uint64_t lostBefore = recordsLost();
        cool();
        (memory.*plan)(n);
        const QlxLogResult result = call(logger, bundle.c_str());
        failures = memory.failures();
        memory.failNone();
        const std::string written = record();
        if (isSuccess(result)) {
          EXPECT_EQ(written, whole);
        }
        // Later allocations fail later.
        const bool isCounted = recordsLost() > lostBefore;
        if (handlerHadIt || isCounted) {
          EXPECT_EQ(isCounted, written.empty());
        }
        handlerHadIt = handlerHadIt || isCounted || !written.empty();
      }
    }
  }

  void expectEveryWay(Call call) const {
    for (const char *logger : kLoggers) {
      for (const char *formatter : kFormatters) {
        for (const bool isCold : {false, true}) {
          SCOPED_TRACE(std::string(logger) + " " + formatter + (isCold ? " cold" : ""));
          ASSERT_EQ(QlxOpenToolkit(config(logger, formatter).c_str(), nullptr), 1);
          QlxObject *object = QlxGetObject("app", nullptr);
          expectEvery(object, call, isCold);
          QlxReleaseObject(object);
          QlxCloseToolkit();
          std::filesystem::remove(dir_.path("app.log"));
        }
      }
    }
  }

  const TempDir dir_;
  const ResourceBundles bundles_;
};

TEST_F(IncompleteRecordTest, OfAMessageIsNoSuccess) {
  expectEveryWay([](QlxObject *logger, const char *bundle) {
    return QlxLogError(logger, bundle, "copied", u"h\u00f6me", 7, 1.5);
  });
}

TEST_F(IncompleteRecordTest, OfATextIsNoSuccess) {
  expectEveryWay(
      [](QlxObject *logger, const char *) { return QlxLogUText(logger, u"ABC0001E text"); });
}

TEST_F(IncompleteRecordTest, OfATextWithArgumentsIsNoSuccess) {
  expectEveryWay([](QlxObject *logger, const char *) {
    return QlxLogUText(logger, u"{0} \u00e9 {1,number,#.##}", u"text", 1.5);
  });
}

TEST_F(IncompleteRecordTest, OfALongTextIsNoSuccess) {
  expectEveryWay([](QlxObject *logger, const char *) {
    return QlxLogDebugMin(logger, "main.c", "main", 42, u"{0}", kLong.c_str());
  });
}

TEST_F(IncompleteRecordTest, HasNoDateWhereIcuHasNone) {
  const IcuDefaults defaults;
  ASSERT_TRUE(IcuDefaults::setLocale("de@numbers=nonsense"));
  for (const char *formatter : kFormatters) {
    SCOPED_TRACE(formatter);
    ASSERT_EQ(QlxOpenToolkit(config("qlx_basiclogger", formatter).c_str(), nullptr), 1);
    QlxObject *logger = QlxGetObject("app", nullptr);
    EXPECT_TRUE(isSuccess(QlxLogUText(logger, u"text")));
    EXPECT_NE(record().find("text"), std::string::npos);
    QlxReleaseObject(logger);
    QlxCloseToolkit();
  }
  EXPECT_EQ(QlxBasicUFormatterFormatDate(nullptr, 0), nullptr);
}

TEST_F(IncompleteRecordTest, OfALongTextAsItStandsIsNoSuccess) {
  expectEveryWay([](QlxObject *logger, const char *) {
    return QlxLogDebugMin(logger, "main.c", "main", 42, kLong.c_str());
  });
}

}  // namespace
