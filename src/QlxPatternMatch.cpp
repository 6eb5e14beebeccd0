// The wildcard match of message identifiers. "*" is the only special character.
#include <string_view>

#include <qlx/class/filter.h>

namespace {

// Takes the next piece between stars off the pattern; empty when there is none.
std::string_view takePiece(std::string_view *pattern) {
  const size_t start = std::min(pattern->find_first_not_of('*'), pattern->size());
  pattern->remove_prefix(start);
  const size_t length = std::min(pattern->find('*'), pattern->size());
  const std::string_view piece = pattern->substr(0, length);
  pattern->remove_prefix(length);
  return piece;
}

}  // namespace

uint8_t QlxPatternMatch(const char *pattern, const char *text) {
  if (!pattern || !text) return 0;
  std::string_view rest{pattern};
  const std::string_view whole{text};
  const bool anchored = !rest.starts_with('*');
  std::string_view piece = takePiece(&rest);
  if (piece.empty()) return 1;

  size_t pos = 0;
  if (anchored) {
    if (rest.empty() || !whole.starts_with(piece)) return rest.empty() && whole == piece;
    pos = piece.size();
    piece = takePiece(&rest);
  }
  // Deliberate: the first occurrence only, without going back, and the last piece ends the text
  // whether a star follows it or not.
  while (!piece.empty()) {
    const size_t found = whole.find(piece, pos);
    if (found == std::string_view::npos) return 0;
    pos = found + piece.size();
    const std::string_view next = takePiece(&rest);
    if (next.empty()) return pos == whole.size();
    piece = next;
  }
  return 1;
}
