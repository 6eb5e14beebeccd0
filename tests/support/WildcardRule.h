// The rule of the wildcard match, written a second time: step by step over the pattern's pieces.
#ifndef QLX_TESTS_WILDCARDRULE_H
#define QLX_TESTS_WILDCARDRULE_H

#include <cstring>
#include <string>
#include <vector>

// What stands between the stars of a pattern.
struct WildcardPiece {
  std::string text;
  bool starAfter;  // the pattern goes on behind it
};

inline std::vector<WildcardPiece> wildcardPieces(const std::string &pattern) {
  std::vector<WildcardPiece> pieces;
  std::string open;
  for (const char c : pattern) {
    if (c != '*') {
      open += c;
    } else if (!open.empty()) {
      pieces.push_back({open, true});
      open.clear();
    }
  }
  if (!open.empty()) pieces.push_back({open, false});
  return pieces;
}

// Where a piece first occurs at or after a position; -1 for nowhere.
inline int firstOccurrence(const std::string &text, const std::string &piece, size_t from) {
  for (size_t at = from; at + piece.size() <= text.size(); ++at) {
    if (std::strncmp(text.c_str() + at, piece.c_str(), piece.size()) == 0) {
      return static_cast<int>(at);
    }
  }
  return -1;
}

inline int matchesByTheRule(const std::string &pattern, const std::string &text) {
  const std::vector<WildcardPiece> pieces = wildcardPieces(pattern);
  if (pieces.empty()) return 1;
  size_t pos = 0;
  for (size_t i = 0; i < pieces.size(); ++i) {
    const auto &[piece, starAfter] = pieces[i];
    const bool isLast = i + 1 == pieces.size();
    if (i == 0 && pattern[0] != '*') {
      const bool begins = text.compare(0, piece.size(), piece) == 0;
      if (!begins || (isLast && !starAfter)) return text == piece && pattern == piece;
      pos = piece.size();
      continue;
    }
    const int found = firstOccurrence(text, piece, pos);
    if (found < 0) return 0;
    pos = static_cast<size_t>(found) + piece.size();
    if (isLast && pos != text.size()) return 0;
  }
  return 1;
}

#endif
