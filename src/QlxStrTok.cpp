// The tokenizer: a position in the caller's string, passed by value. Without delimiters every byte
// is a token.
#include <qlx/props.h>

#include <cstring>

#include <qlx/memory.h>

static bool atEnd(QlxStrTok state) {
  return !state.cursor || !*state.cursor;
}

static bool hasDelims(QlxStrTok state) {
  return state.delims && *state.delims;
}

static const char *tokenStart(QlxStrTok state) {
  return hasDelims(state) ? state.cursor + OslStringStrspn(state.cursor, state.delims)
                          : state.cursor;
}

static uint32_t tokenLength(QlxStrTok state, const char *start) {
  return hasDelims(state) ? OslStringStrcspn(start, state.delims) : 1;
}

QlxStrTok QlxStrTokIterator(const char *string, const char *delims) {
  return {string, delims};
}

uint8_t QlxStrTokIterHasNext(QlxStrTok state) {
  return !atEnd(state) && *tokenStart(state) != 0;
}

char *QlxStrTokIterGet(QlxStrTok state) {
  if (!QlxStrTokIterHasNext(state)) return nullptr;
  const char *start = tokenStart(state);
  const uint32_t length = tokenLength(state, start);
  auto *token = static_cast<char *>(OslMemoryMalloc(length + 1));
  if (!token) return nullptr;
  std::memcpy(token, start, length);
  token[length] = 0;
  return token;
}

QlxStrTok QlxStrTokIterNext(QlxStrTok state) {
  if (atEnd(state)) return state;
  const char *start = tokenStart(state);
  return {*start ? start + tokenLength(state, start) : start, state.delims};
}
