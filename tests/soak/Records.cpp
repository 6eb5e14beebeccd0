#include "Records.h"

#include <cinttypes>
#include <cstdio>
#include <fstream>
#include <iterator>
#include <optional>

static constexpr size_t kChecksumDigits = 16;

static std::string checksumOf(std::string_view bytes) {
  uint64_t sum = 14695981039346656037u;
  for (const char c : bytes) sum = (sum ^ static_cast<unsigned char>(c)) * 1099511628211u;
  char digits[kChecksumDigits + 1];
  std::snprintf(digits, sizeof digits, "%016" PRIx64, sum);
  return digits;
}

std::string recordText(RecordId id, size_t padding) {
  const std::string body = std::to_string(id.first) + " " + std::to_string(id.second) + " " +
                           std::string(padding, static_cast<char>('a' + id.second % 26));
  return "<" + body + checksumOf(body) + ">";
}

// The record that a piece is; none when it is not whole.
static std::optional<RecordId> parsePiece(std::string_view piece) {
  if (piece.size() < kChecksumDigits + 2 || piece.front() != '<' || piece.back() != '>') return {};
  const std::string body{piece.substr(1, piece.size() - kChecksumDigits - 2)};
  if (piece.substr(1 + body.size(), kChecksumDigits) != checksumOf(body)) return {};
  RecordId id;
  if (std::sscanf(body.c_str(), "%" SCNu32 " %" SCNu32, &id.first, &id.second) != 2) return {};
  return id;
}

void parseRecords(std::string_view bytes, Findings *findings) {
  while (!bytes.empty()) {
    // A piece ends where the next one begins: behind a fragment there is no line feed.
    const size_t next = bytes.find('<', 1);
    std::string_view piece = bytes.substr(0, next);
    bytes.remove_prefix(piece.size());
    const bool ended = piece.back() == '\n';
    if (ended) piece.remove_suffix(1);
    const std::optional<RecordId> id = parsePiece(piece);
    if (id) ++findings->records[*id];
    if (!id || !ended) ++findings->fragments;
  }
}

uint64_t Findings::repeated() const {
  uint64_t count = 0;
  for (const auto &[id, times] : records) count += times > 1;
  return count;
}

static std::optional<std::string> readGeneration(const std::string &folder, int generation) {
  const std::string number = generation == 0 ? "" : std::to_string(generation);
  std::ifstream file(folder + "/app" + number + ".log", std::ios::binary);
  if (!file) return {};
  return std::string{std::istreambuf_iterator<char>(file), std::istreambuf_iterator<char>()};
}

static uint64_t countRecords(std::string_view bytes) {
  Findings inside;
  parseRecords(bytes, &inside);
  return inside.records.size();
}

Findings lookInto(const std::string &folder, int lastGeneration) {
  Findings findings;
  std::optional<std::string> newer;  // the next newer file that is no cut copy
  for (int generation = 0; generation <= lastGeneration; ++generation) {
    std::optional<std::string> bytes = readGeneration(folder, generation);
    if (!bytes) continue;
    ++findings.files;
    findings.largestFile = std::max<uint64_t>(findings.largestFile, bytes->size());
    if (newer && newer->starts_with(*bytes)) {
      ++findings.cutCopies;
      findings.recordsInCutCopies += countRecords(*bytes);
      continue;
    }
    parseRecords(*bytes, &findings);
    newer = std::move(bytes);
  }
  return findings;
}
