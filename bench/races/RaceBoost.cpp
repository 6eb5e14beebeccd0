// Boost.Log: a synchronous text file sink that is flushed after every record. File, function and
// line are part of the streamed text, which is cheaper than an attribute for each.
#include <boost/date_time/posix_time/posix_time_types.hpp>
#include <boost/log/attributes/clock.hpp>
#include <boost/log/core.hpp>
#include <boost/log/expressions.hpp>
#include <boost/log/sinks/sync_frontend.hpp>
#include <boost/log/sinks/text_file_backend.hpp>
#include <boost/log/sources/record_ostream.hpp>
#include <boost/log/sources/severity_logger.hpp>
#include <boost/log/support/date_time.hpp>
#include <boost/make_shared.hpp>
#include <boost/version.hpp>

#include <string>

#include "Race.h"

namespace attrs = boost::log::attributes;
namespace expr = boost::log::expressions;
namespace keywords = boost::log::keywords;
namespace sinks = boost::log::sinks;

namespace {

enum Severity { Trace, Debug };

class BoostRacer : public race::Racer {
 public:
  static std::string version() {
    return "Boost.Log " + std::to_string(BOOST_VERSION / 100000) + "." +
           std::to_string(BOOST_VERSION / 100 % 1000);
  }
  static bool takesPart(const race::Row &row) { return !race::isOwnRow(row); }
  static race::Shape shape(const race::Row &row) {
    race::Shape shape = race::lineShape(row, "RaceBoost.cpp");
    shape.record.insert(shape.record.find(".###") + 1, "###");
    return shape;
  }

  explicit BoostRacer(const race::Setup &setup) {
    const auto backend = boost::make_shared<sinks::text_file_backend>(
        keywords::file_name = setup.path, keywords::target_file_name = "race%N.log",
        keywords::rotation_size = setup.maxBytes, keywords::open_mode = std::ios_base::app,
        keywords::enable_final_rotation = false, keywords::auto_flush = true);
    backend->set_file_collector(sinks::file::make_collector(keywords::target = setup.folder,
                                                            keywords::max_files = setup.files - 1));
    const auto sink =
        boost::make_shared<sinks::synchronous_sink<sinks::text_file_backend>>(backend);
    sink->set_formatter(expr::stream << expr::format_date_time<boost::posix_time::ptime>(
                                            "TimeStamp", "%Y-%m-%d %H:%M:%S.%f")
                                     << ' ' << expr::smessage);
    boost::log::core::get()->add_global_attribute("TimeStamp", attrs::local_clock());
    boost::log::core::get()->add_sink(sink);
    boost::log::core::get()->set_filter(expr::attr<Severity>("Severity") >= Debug);
  }
  ~BoostRacer() { boost::log::core::get()->remove_all_sinks(); }

  void suppressed() { BOOST_LOG_SEV(logger_, Trace) << race::kText; }
  void text() {
    BOOST_LOG_SEV(logger_, Debug) << "RaceBoost.cpp " << __func__ << ' ' << __LINE__ << ' '
                                  << race::kText;
  }
  void message() {
    BOOST_LOG_SEV(logger_, Debug) << "user "
                                  << "alice"
                                  << " moved " << 12345 << " items at " << 2.75 << " a second";
  }

 private:
  boost::log::sources::severity_logger_mt<Severity> logger_;
};

}  // namespace

RACE_MAIN(BoostRacer, "boost")
