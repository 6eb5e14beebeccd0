// spdlog: its rotating file, flushed after every record.
#define SPDLOG_ACTIVE_LEVEL SPDLOG_LEVEL_TRACE
#include <spdlog/sinks/rotating_file_sink.h>
#include <spdlog/spdlog.h>

#include <memory>
#include <string>

#include "Race.h"

namespace {

class SpdlogRacer : public race::Racer {
 public:
  static std::string version() {
    return "spdlog " + std::to_string(SPDLOG_VER_MAJOR) + "." + std::to_string(SPDLOG_VER_MINOR) +
           "." + std::to_string(SPDLOG_VER_PATCH);
  }
  static bool takesPart(const race::Row &row) { return !race::isOwnRow(row); }
  static race::Shape shape(const race::Row &row) { return race::lineShape(row, "RaceSpdlog.cpp"); }

  explicit SpdlogRacer(const race::Setup &setup)
      : logger_("race", std::make_shared<spdlog::sinks::rotating_file_sink_mt>(
                            setup.path, setup.maxBytes, setup.files - 1)) {
    logger_.set_level(spdlog::level::debug);
    logger_.flush_on(spdlog::level::trace);
    logger_.set_pattern(setup.source ? "%Y-%m-%d %H:%M:%S.%e %s %! %# %v"
                                     : "%Y-%m-%d %H:%M:%S.%e %v");
  }

  void suppressed() { SPDLOG_LOGGER_TRACE(&logger_, race::kText); }
  void text() { SPDLOG_LOGGER_DEBUG(&logger_, race::kText); }
  void message() { logger_.info("user {} moved {} items at {} a second", "alice", 12345, 2.75); }

 private:
  spdlog::logger logger_;
};

}  // namespace

RACE_MAIN(SpdlogRacer, "spdlog")
