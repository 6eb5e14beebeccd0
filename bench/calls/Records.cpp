// Some records of a row of the races and nothing else, for what counts instructions: the racer of
// Qlx, with this in place of Race.cpp. Time stands still but between records, so two runs differ by
// their records alone.
//
//   qlx_records ROW FOLDER RECORDS MICROSECONDS   so many records, each so long after the one
//   before
#include <stdlib.h>
#include <sys/time.h>
#include <time.h>

#include <filesystem>
#include <string>
#include <string_view>

#include "../races/Race.h"

namespace {

constexpr int64_t kMaxBytes = 1'000'000'000;
constexpr int64_t kTick = 4000;  // the coarse clock's, in microseconds

constexpr race::Row kRows[] = {
    {.name = "text", .call = race::Call::Text, .records = 0},
    {.name = "message", .call = race::Call::Message, .records = 0},
    {.name = "localized", .call = race::Call::Localized, .records = 0},
    {.name = "xml", .call = race::Call::Text, .records = 0, .layout = race::Layout::Xml},
    {.name = "trace", .call = race::Call::Text, .records = 0, .layout = race::Layout::Trace},
};

int64_t gMicroseconds = 1'800'000'000'000'000;  // on a whole second

}  // namespace

// In place of libc's, also for the library. Each clock shows the same time.
extern "C" int gettimeofday(timeval *now, void *) noexcept {
  *now = {gMicroseconds / 1'000'000, gMicroseconds % 1'000'000};
  return 0;
}
extern "C" int clock_gettime(clockid_t clock, timespec *now) noexcept {
  const int64_t step = clock == CLOCK_MONOTONIC_COARSE ? kTick : 1;
  const int64_t shown = gMicroseconds / step * step;
  *now = {shown / 1'000'000, shown % 1'000'000 * 1000};
  return 0;
}

int race::run(int argc, char **argv, const Field &field) {
  if (argc != 5) return 2;
  const std::string folder = argv[2];
  const int64_t records = strtoll(argv[3], nullptr, 10), apart = strtoll(argv[4], nullptr, 10);
  std::filesystem::create_directories(folder);
  for (const Row &row : kRows) {
    if (row.name != argv[1]) continue;
    const Setup setup = {.folder = folder,
                         .path = folder + "/race.log",
                         .maxBytes = kMaxBytes,
                         .files = 3,
                         .source = row.call == Call::Text,
                         .shared = false,
                         .layout = row.layout,
                         .stamped = false};
    field.withLogger(setup, row.call, [&](const Log &log) {
      for (int64_t i = 0; i < records; ++i) {
        log(1);
        gMicroseconds += apart;
      }
    });
    std::filesystem::remove_all(folder);
    return 0;
  }
  return 2;
}
