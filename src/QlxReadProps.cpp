// The properties file reader: the machine sees one byte of the file after the other.
#include "QlxReadProps.h"

#include <cstring>

#include <qlx/buffers.h>
#include <qlx/memory.h>

#include "QlxLogManager.h"
#include "util/CxThread.h"
#include "util/CxStatus.h"

namespace {

enum class ByteClass { kBlank, kLineEnd, kComment, kSeparator, kEscape, kOther };

}  // namespace

static ByteClass classOf(uint8_t byte) {
  switch (byte) {
    case '\t':
    case '\v':
    case '\f':
    case ' ':
      return ByteClass::kBlank;
    case '\n':
    case '\r':
      return ByteClass::kLineEnd;
    case '!':
    case '#':
      return ByteClass::kComment;
    case ':':
    case '=':
      return ByteClass::kSeparator;
    case '\\':
      return ByteClass::kEscape;
    default:
      return ByteClass::kOther;
  }
}

static int32_t appendKey(uint8_t byte, ReadPropsContext *context) {
  return CxStringBuffAppendChar(&context->keyBuf, static_cast<char>(byte)) ? kKeyChars : kError;
}

static int32_t appendVal(uint8_t byte, ReadPropsContext *context) {
  return CxStringBuffAppendChar(&context->valBuf, static_cast<char>(byte)) ? kValChars : kError;
}

static int32_t emit(ReadPropsContext *context) {
  return qlxRdprEmitCfg(context) ? kStartLine : kError;
}

// Splits the key at its last dot: the configuration's name before it, the property's after it.
static uint8_t emitToLogManager(char *key, const char *value) {
  char *dot = OslStringRChr(key, '.');
  if (!dot) return 0;
  *dot = 0;
  const uint8_t accepted = qlxLogMgrAddCfgFromFile(key, dot + 1, value);
  *dot = '.';
  return accepted;
}

uint8_t qlxRdprEmitCfg(ReadPropsContext *context) {
  char *key = context->keyBuf.data;
  if (!key) return 0;
  const char *value = context->valBuf.data ? context->valBuf.data : "";
  return context->propList ? cxPropIndexPut(&context->index, context->propList, key, value)
                           : emitToLogManager(key, value);
}

int32_t qlxRdprDoStartLineState(uint8_t byte, ReadPropsContext *context) {
  CxStringBuffRestart(&context->keyBuf);
  CxStringBuffRestart(&context->valBuf);
  switch (classOf(byte)) {
    case ByteClass::kBlank:
      return kStartLineBlanks;
    case ByteClass::kLineEnd:
      return kStartLine;
    case ByteClass::kComment:
      return kCommentLine;
    default:
      return appendKey(byte, context);  // Deliberate: here a separator is a byte of the key
  }
}

int32_t qlxRdprDoStartLineBlanksState(uint8_t byte, ReadPropsContext *context) {
  switch (classOf(byte)) {
    case ByteClass::kBlank:
      return kStartLineBlanks;
    case ByteClass::kLineEnd:
      return kStartLine;
    case ByteClass::kComment:
      return kCommentLine;
    case ByteClass::kSeparator:
      return kError;
    default:
      return appendKey(byte, context);
  }
}

int32_t qlxRdprDoCommentLineState(uint8_t byte, ReadPropsContext *) {
  return classOf(byte) == ByteClass::kLineEnd ? kStartLine : kCommentLine;
}

int32_t qlxRdprDoKeyCharsState(uint8_t byte, ReadPropsContext *context) {
  switch (classOf(byte)) {
    case ByteClass::kBlank:
      return kKeyEndBlanksFirst;
    case ByteClass::kLineEnd:
      return kError;
    case ByteClass::kSeparator:
      return kKeyEndBlanksFinal;
    case ByteClass::kEscape:
      return kKeyCharEscape;
    default:
      return appendKey(byte, context);
  }
}

int32_t qlxRdprDoKeyCharEscapeState(uint8_t byte, ReadPropsContext *context) {
  switch (classOf(byte)) {
    case ByteClass::kBlank:
    case ByteClass::kSeparator:
    case ByteClass::kEscape:
      return appendKey(byte, context);
    default:
      return kError;
  }
}

int32_t qlxRdprDoKeyEndBlanksFirstState(uint8_t byte, ReadPropsContext *context) {
  switch (classOf(byte)) {
    case ByteClass::kBlank:
      return kKeyEndBlanksFirst;
    case ByteClass::kLineEnd:
      return kError;
    case ByteClass::kSeparator:
      return kKeyEndBlanksFinal;
    case ByteClass::kEscape:
      return kValEscape;
    default:
      return appendVal(byte, context);
  }
}

int32_t qlxRdprDoKeyEndBlanksFinalState(uint8_t byte, ReadPropsContext *context) {
  switch (classOf(byte)) {
    case ByteClass::kBlank:
      return kKeyEndBlanksFinal;
    case ByteClass::kLineEnd:
      return emit(context);
    case ByteClass::kEscape:
      return kValEscape;
    default:
      return appendVal(byte, context);
  }
}

int32_t qlxRdprDoValCharsState(uint8_t byte, ReadPropsContext *context) {
  switch (classOf(byte)) {
    case ByteClass::kLineEnd:
      return emit(context);
    case ByteClass::kEscape:
      return kValEscape;
    default:
      return appendVal(byte, context);
  }
}

// Of the other bytes only the quotes stand for themselves; there is no escape for a line feed or a
// tab.
static int32_t escapedOther(uint8_t byte, ReadPropsContext *context) {
  switch (byte) {
    case '"':
    case '\'':
      return appendVal(byte, context);
    case 'u':
    case 'U':
      return kUU0;
    default:
      return kError;
  }
}

int32_t qlxRdprDoValEscapeState(uint8_t byte, ReadPropsContext *context) {
  switch (classOf(byte)) {
    case ByteClass::kBlank:
    case ByteClass::kEscape:
      return appendVal(byte, context);
    case ByteClass::kLineEnd:
      return kMultiLineVal;
    case ByteClass::kOther:
      return escapedOther(byte, context);
    default:
      return kError;
  }
}

int32_t qlxRdprDoMultiLineValState(uint8_t byte, ReadPropsContext *context) {
  switch (classOf(byte)) {
    case ByteClass::kBlank:
      return kMultiLineVal;
    case ByteClass::kLineEnd:
      return emit(context);
    case ByteClass::kEscape:
      return kValEscape;
    default:
      return appendVal(byte, context);
  }
}

int32_t qlxRdprHexConv(uint8_t byte) {
  if (byte >= '0' && byte <= '9') return byte - '0';
  if (byte >= 'a' && byte <= 'f') return byte - 'a';
  if (byte >= 'A' && byte <= 'F') return byte - 'A';
  return -1;
}

// Deliberate: the digits of all escapes of a file add up.
static int32_t addDigit(uint8_t byte, uint32_t shift, int32_t next, ReadPropsContext *context) {
  const int32_t digit = qlxRdprHexConv(byte);
  if (digit < 0) return kError;
  context->uAcc += static_cast<uint32_t>(digit) << shift;
  return next;
}

int32_t qlxRdprDoUU0State(uint8_t byte, ReadPropsContext *context) {
  return addDigit(byte, 12, kUU1, context);
}

int32_t qlxRdprDoUU1State(uint8_t byte, ReadPropsContext *context) {
  return addDigit(byte, 8, kUU2, context);
}

int32_t qlxRdprDoUU2State(uint8_t byte, ReadPropsContext *context) {
  return addDigit(byte, 4, kUU3, context);
}

int32_t qlxRdprDoUU3State(uint8_t byte, ReadPropsContext *context) {
  const int32_t next = addDigit(byte, 0, kValChars, context);
  if (next == kError) return kError;
  const auto codePoint = static_cast<int32_t>(context->uAcc);
  return CxStringBuffAppendUTF32Char(&context->valBuf, codePoint) ? kValChars : kError;
}

const ReadPropsStateFunction qlxRdprSTATE_HANDLER_FUNCS[kDone] = {
    nullptr,
    qlxRdprDoStartLineState,
    qlxRdprDoStartLineBlanksState,
    qlxRdprDoCommentLineState,
    qlxRdprDoKeyCharsState,
    qlxRdprDoKeyCharEscapeState,
    qlxRdprDoKeyEndBlanksFirstState,
    qlxRdprDoKeyEndBlanksFinalState,
    qlxRdprDoValCharsState,
    qlxRdprDoValEscapeState,
    qlxRdprDoMultiLineValState,
    qlxRdprDoUU0State,
    qlxRdprDoUU1State,
    qlxRdprDoUU2State,
    qlxRdprDoUU3State,
};

// Deliberate: a key in the buffer is delivered whatever the state. A pair whose line ended and that
// no further line replaced is delivered once more.
static int32_t atEndOfFile(ReadPropsContext *context) {
  return context->keyBuf.length == 0 || qlxRdprEmitCfg(context) ? kDone : kError;
}

// Deliberate: of line ends in a row only the first is seen, in every state.
static int32_t step(ReadPropsContext *context, uint8_t byte) {
  const uint8_t previous = context->prevByte;
  context->prevByte = byte;
  if (classOf(previous) == ByteClass::kLineEnd && classOf(byte) == ByteClass::kLineEnd)
    return context->state;
  const ReadPropsStateFunction function = qlxRdprSTATE_HANDLER_FUNCS[context->state];
  return function ? function(byte, context) : kError;
}

// A byte order mark, as some editors put it before UTF-8, is no part of the first key.
static std::span<const uint8_t> withoutMark(std::span<const uint8_t> bytes) {
  static constexpr uint8_t kMark[] = {0xEF, 0xBB, 0xBF};
  const bool isMarked =
      bytes.size() >= sizeof kMark && std::memcmp(bytes.data(), kMark, sizeof kMark) == 0;
  return isMarked ? bytes.subspan(sizeof kMark) : bytes;
}

static bool isReading(const ReadPropsContext &context) {
  return context.state >= kStartLine && context.state < kDone;
}

uint8_t qlxDeliverProps(const QlxPropsFile &file, CxPropList *propList, CxStatus *status) {
  ReadPropsContext context{};
  context.propList = propList;
  context.state = kStartLine;
  for (const uint8_t byte : withoutMark(file.bytes())) {
    if (!isReading(context)) break;
    context.state = step(&context, byte);
  }
  const bool gotThere = isReading(context);
  if (gotThere) context.state = file.isWhole ? atEndOfFile(&context) : kError;
  CxStringBuffDiscard(&context.keyBuf);
  CxStringBuffDiscard(&context.valBuf);
  cxPropIndexDiscard(&context.index);
  const bool failed = cxFailed(file.status) && (gotThere || file.isWhole);
  if (failed && status) *status = file.status;
  return context.state == kDone && !failed;
}

uint8_t qlxDoReadProps(const char *path, CxPropList *propList, CxStatus *status) {
  const CxNoCancel untilItIsFreed;
  return qlxDeliverProps(qlxLoadProps(path), propList, status);
}

uint8_t CxPropListRead(const char *path, CxPropList *list, CxStatus *status) {
  return list ? qlxDoReadProps(path, list, status) : 0;
}
