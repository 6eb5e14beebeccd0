// Every allocation of the classes for problem determination fails once, alone and with all after
// it: a logger that stamps, a filter of message identifiers that suppresses repeats, and trace
// lines and XML records in files. Afterwards the same configuration works as if nothing had been.
#include <gtest/gtest.h>

#include <filesystem>
#include <memory>
#include <string>

#include <qlx/qlx.h>

#include "support/CaptureStdout.h"
#include "support/EveryFailure.h"
#include "support/FailureResult.h"
#include "support/Handle.h"
#include "support/HostName.h"
#include "support/IcuDefaults.h"
#include "support/ResourceBundles.h"
#include "support/TempDir.h"
#include "support/WorkingDir.h"

namespace {

class ProblemDeterminationFailureTest : public ::testing::Test {
 protected:
  void SetUp() override {
    madeUpName = "alpha";
    ASSERT_TRUE(IcuDefaults::setLocale("en_US"));
    ASSERT_TRUE(bundles_.add("root", R"(
      copied { "ABC0001E {1,number,integer} files from {0}" }
      minor { "ABC0002I {0}" }
    )"));
    dir_.write("app.properties", R"(
app.className = qlx_pdlogger
app.level = ALL
app.organization = Org
app.product = Quill
app.server = alpha.example.org
app.listenerNames = filter
filter.className = qlx_msgidfilter
filter.mode = BLOCK
filter.msgIds = *I XYZ*
filter.msgIdRepeatTime = 3600000
filter.listenerNames = lines records
trace.className = qlx_vextraceformatter
lines.className = qlx_filehandler
lines.formatterName = trace
xml.className = qlx_xmlformatter
xml.singleServer = true
xml.dateTimeFormat = '-'
records.className = qlx_filehandler
records.formatterName = xml
records.fileName = )" + dir_.path("logs/app.xml") +
                                     R"(
lines.fileName = )" + dir_.path("logs/app.log"));
  }

  void TearDown() override { madeUpName = nullptr; }

  std::string config() const { return dir_.path("app.properties"); }

  void logAll(const Tries &tries, QlxObject *logger) const {
    const std::string bundle = bundles_.path();
    expectResult(tries, QlxLogError(logger, bundle.c_str(), "copied", u"home", 7));
    expectResult(tries, QlxLogInfo(logger, bundle.c_str(), "minor", u"blocked"));
    expectResult(tries, QlxLogDebugMid(logger, "a.c", "f", 7, u"XYZ0001W blocked"));
    expectResult(tries, QlxLogDebugMax(logger, "a.c", "f", 7, u"{0} passes", u"this"));
  }

  // What the file has after one error and one that repeats it, behind the time.
  static std::string expectedRest() {
    return " - ERROR - alpha - p" + std::to_string(CxProcessGetCurrentID()) + ":t" +
           std::to_string(static_cast<uint32_t>(CxThreadGetCurrentID())) +
           " -  - ABC0001E - ABC0001E 7 files from home\n";
  }

  // The same of the other file, behind the milliseconds.
  std::string expectedRecordRest() const {
    return "\">-</Time>\n <ProductId>Quill</ProductId>\n"
           " <LogText><![CDATA[ABC0001E 7 files from home]]></LogText>\n"
           " <LogAttribs><Key>organization</Key><Value>Org</Value></LogAttribs>\n"
           " <TranslationInfo Resource Bundle=\"" +
           bundles_.path() +
           "\" MsgKey=\"copied\"><Param><![CDATA[home]]></Param><Param><![CDATA[7]]></Param>"
           "</TranslationInfo>\n</Message>\n";
  }

  void expectWorking() const {
    for (const char *file : {"logs/app.log", "logs/app.xml"}) {
      std::filesystem::remove(dir_.path(file));
    }
    ASSERT_EQ(QlxOpenToolkit(config().c_str(), nullptr), 1);
    {
      const Handle logger{QlxGetObject("app", nullptr)};
      for (int i = 0; i < 2; ++i) {
        const QlxLogResult result =
            QlxLogError(logger.get(), bundles_.path().c_str(), "copied", u"home", 7);
        EXPECT_EQ(result, (QlxLogResult{'-', 0, 0}));
      }
    }
    QlxCloseToolkit();
    const std::string line = dir_.read("logs/app.log");
    ASSERT_EQ(line.substr(0, 2), "\x1e[");
    ASSERT_EQ(line.substr(std::min(line.find("] - ") + 1, line.size())), expectedRest());
    const std::string record = dir_.read("logs/app.xml");
    ASSERT_TRUE(
        record.starts_with(" <Server Format=\"IP\">alpha.example.org</Server>\n"
                           "<Message Id=\"ABC0001E\" Severity=\"ERROR\">\n"))
        << record;
    ASSERT_TRUE(record.ends_with(expectedRecordRest())) << record;
  }

  template <typename Scenario>
  void withEveryFailureOf(Scenario scenario) {
    const WorkingDir working(dir_.path());  // for a handler that lost its file's name
    const CaptureStdout console;            // for the toolkit's own logger
    withEveryFailure(scenario, [this] { expectWorking(); });
  }

  const IcuDefaults defaults_;
  const TempDir dir_;
  const ResourceBundles bundles_;
};

TEST_F(ProblemDeterminationFailureTest, StampsFiltersAndRecordsWhatItCan) {
  withEveryFailureOf([this](Tries &tries) {
    QlxOpenToolkit(config().c_str(), nullptr);
    {
      const Handle logger{tries.mayFail(QlxGetObject("app", nullptr))};
      logAll(tries, logger.get());
      logAll(tries, logger.get());  // the second time with repeats
    }
    QlxCloseToolkit();
  });
}

TEST_F(ProblemDeterminationFailureTest, ChangesEveryKeyWhileItLogs) {
  static constexpr struct {
    const char *object, *key, *value;
  } kChanges[] = {
      {"app", "organization", "Other"},
      {"app", "product", nullptr},
      {"app", "component", "Copier"},
      {"app", "client", "me"},
      {"app", "server", "beta"},
      {"app", "serverFormat", "DNS"},
      {"app", "productInstance", "1"},
      {"filter", "mode", "passthru"},
      {"filter", "msgIds", "ABC* XYZ* *W"},
      {"filter", "msgIdRepeatTime", "1"},
      {"trace", "dateTimeFormat", "HH"},
      {"xml", "singleServer", nullptr},
      {"xml", "singleProduct", "true"},
      {"xml", "forceAsMessage", "true"},
      {"xml", "dateTimeFormat", nullptr},
      {"xml", "locale", "de"},
  };
  withEveryFailureOf([this](Tries &tries) {
    QlxOpenToolkit(config().c_str(), nullptr);
    {
      const Handle logger{tries.mayFail(QlxGetObject("app", nullptr))};
      for (const auto &[name, key, value] : kChanges) {
        const Handle object{QlxGetObject(name, nullptr)};
        const uint8_t stored = QlxSetObjProp(object.get(), key, value);
        if (object) tries.mayFail(stored);
        expectResult(tries, QlxLogUText(logger.get(), u"XYZ0001W after a change"));
      }
    }
    QlxCloseToolkit();
  });
}

TEST_F(ProblemDeterminationFailureTest, SharesAFormatterAmongThoseThatThereIsMemoryFor) {
  withEveryFailureOf([](Tries &tries) {
    QlxOpenToolkit(nullptr, nullptr);
    {
      const Handle loggers[] = {Handle{tries.mayFail(QlxGetObject("a", "qlx_pdlogger"))},
                                Handle{tries.mayFail(QlxGetObject("b", "qlx_pdlogger"))}};
      const Handle filters[] = {Handle{tries.mayFail(QlxGetObject("c", "qlx_msgidfilter"))},
                                Handle{tries.mayFail(QlxGetObject("d", "qlx_msgidfilter"))}};
      for (const char *name : {"quill.pdMsgIdFormatter", "msgFormatter"}) {
        const Handle shared{QlxGetObject(name, nullptr)};
        if (tries.nothingFailed()) {
          EXPECT_EQ(shared->refCount, 4u);
        }
        // Made only when memory was short for the formatter, so that the name was free.
        const Handle other{QlxGetObject(name, "qlx_pdlogger")};
        EXPECT_FALSE(shared && other);
      }
      tries.mayFail(QlxAddListener(loggers[0].get(), filters[0].get()));
      expectResult(tries, QlxLogUText(loggers[0].get(), u"ABC0001E text"));
    }
    QlxCloseToolkit();
  });
}

}  // namespace
