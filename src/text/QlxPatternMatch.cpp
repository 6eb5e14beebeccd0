// The wildcard match of message identifiers. "*" is the only special character.
#include <qlx/class/filter.h>

#include <algorithm>
#include <string_view>

// Takes the next piece between stars off the pattern; empty when there is none.
static std::string_view takePiece(std::string_view *pattern) {
  pattern->remove_prefix(std::min(pattern->find_first_not_of('*'), pattern->size()));
  const std::string_view piece = pattern->substr(0, pattern->find('*'));
  pattern->remove_prefix(piece.size());
  return piece;
}

uint8_t QlxPatternMatch(const char *pattern, const char *text) {
  if (!pattern || !text) return 0;
  std::string_view rest{pattern};
  std::string_view unmatched{text};
  const bool atStart = !rest.starts_with('*');
  std::string_view piece = takePiece(&rest);
  if (piece.empty()) return 1;

  if (atStart) {
    if (rest.empty()) return unmatched == piece;
    if (!unmatched.starts_with(piece)) return 0;
    unmatched.remove_prefix(piece.size());
    piece = takePiece(&rest);
    if (piece.empty()) return 1;
  }
  // Deliberate: the first occurrence only, without going back, and the last piece ends the text
  // whether a star follows it or not.
  for (; !piece.empty(); piece = takePiece(&rest)) {
    const size_t found = unmatched.find(piece);
    if (found == std::string_view::npos) return 0;
    unmatched.remove_prefix(found + piece.size());
  }
  return unmatched.empty();
}
