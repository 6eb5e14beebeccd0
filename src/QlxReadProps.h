// The properties file reader: a state machine over bytes. Each state is a function that takes the
// byte and answers the next state; a table finds it by the state's number.
#ifndef QLX_SRC_QLXREADPROPS_H
#define QLX_SRC_QLXREADPROPS_H

#include "file/QlxPropsFile.h"
#include "util/CxPropList.h"

QLX_BEGIN_DECLS

// The numbers index the table of state functions.
enum ReadPropsState : int32_t {
  kStartLine = 1,
  kStartLineBlanks,
  kCommentLine,
  kKeyChars,
  kKeyCharEscape,
  kKeyEndBlanksFirst,
  kKeyEndBlanksFinal,
  kValChars,
  kValEscape,
  kMultiLineVal,
  kUU0,
  kUU1,
  kUU2,
  kUU3,
  kDone,   // the end of the file was reached cleanly
  kError,  // a syntax error, a refused pair, no memory or a failure of the system
};

// One read, on the reader's own stack.
typedef struct ReadPropsContext {
  CxStringBuff keyBuf;   // the current key ...
  CxStringBuff valBuf;   // ... and value; cleared only where the next line starts
  uint32_t uAcc;         // sum of the \u digits of the whole file: never cleared
  CxPropList *propList;  // borrowed; null sends the pairs to the log manager
  int32_t state;         // a ReadPropsState; kStartLine at first
  uint8_t prevByte;      // the byte before the current one, 0 at first
  CxPropIndex index;     // of the property list, for this read
} ReadPropsContext;

typedef int32_t (*ReadPropsStateFunction)(uint8_t byte, ReadPropsContext *context);

// Entry 0 is empty.
extern const ReadPropsStateFunction qlxRdprSTATE_HANDLER_FUNCS[kDone];

/*
 * Reads a properties file into a list, or into the log manager when the list is null; the log
 * manager expects the API lock to be held. Answers 1 when the whole file was read and every pair
 * accepted; pairs before a failure stay delivered. `status` may be null and is written only when
 * the system fails, never for a syntax error.
 */
uint8_t qlxDoReadProps(const char *path, CxPropList *propList, CxStatus *status);

// Delivers the current pair; 0 when it is refused. A key without a value has the empty value.
uint8_t qlxRdprEmitCfg(ReadPropsContext *context);

// The worth of a hexadecimal digit, or -1. Deliberate: the letters a to f are worth 0 to 5.
int32_t qlxRdprHexConv(uint8_t byte);

int32_t qlxRdprDoStartLineState(uint8_t byte, ReadPropsContext *context);
int32_t qlxRdprDoStartLineBlanksState(uint8_t byte, ReadPropsContext *context);
int32_t qlxRdprDoCommentLineState(uint8_t byte, ReadPropsContext *context);
int32_t qlxRdprDoKeyCharsState(uint8_t byte, ReadPropsContext *context);
int32_t qlxRdprDoKeyCharEscapeState(uint8_t byte, ReadPropsContext *context);
int32_t qlxRdprDoKeyEndBlanksFirstState(uint8_t byte, ReadPropsContext *context);
int32_t qlxRdprDoKeyEndBlanksFinalState(uint8_t byte, ReadPropsContext *context);
int32_t qlxRdprDoValCharsState(uint8_t byte, ReadPropsContext *context);
int32_t qlxRdprDoValEscapeState(uint8_t byte, ReadPropsContext *context);
int32_t qlxRdprDoMultiLineValState(uint8_t byte, ReadPropsContext *context);
int32_t qlxRdprDoUU0State(uint8_t byte, ReadPropsContext *context);
int32_t qlxRdprDoUU1State(uint8_t byte, ReadPropsContext *context);
int32_t qlxRdprDoUU2State(uint8_t byte, ReadPropsContext *context);
int32_t qlxRdprDoUU3State(uint8_t byte, ReadPropsContext *context);

QLX_END_DECLS

// The second half of qlxDoReadProps(), and the only one that wants the lock.
uint8_t qlxDeliverProps(const QlxPropsFile &file, CxPropList *propList, CxStatus *status);

#endif
