// The message-identifier filter: blocks, or passes only, events whose identifier matches one of its
// patterns, and suppresses repeats of an identifier within a time.
#include <qlx/class/filter.h>

#include <cinttypes>
#include <cstdio>
#include <limits>

#include <qlx/class/containers.h>
#include <qlx/class/msgid.h>
#include <qlx/class/object.h>
#include <qlx/memory.h>
#include <qlx/props.h>

#include "object/QlxClasses.h"
#include "object/QlxObjClass.h"
#include "object/QlxConfigKeys.h"
#include "QlxObject.h"
#include "QlxProps.h"

namespace {

constexpr uint32_t kBlock = 1, kPassThru = 2;
constexpr const char *kDefaultPatterns = "*W *I";
constexpr const char *kBlanks = " \t\n\r";  // between patterns; no others

struct MsgIdFilterVars {
  uint32_t mode;                 // kBlock: block what matches; kPassThru: pass only what matches
  StringList *patterns;          // owned
  QlxObject *idFormatter;        // counted: the shared object "msgFormatter"
  int64_t repeatTime;            // milliseconds of event time; 0 and less: no suppression
  StringToStringMap *lastTimes;  // owned: identifier to its last passed event's time, in decimal
};

MsgIdFilterVars *varsOf(QlxObject *filter) {
  return filter ? static_cast<MsgIdFilterVars *>(filter->vars) : nullptr;
}

}  // namespace

StringList *QlxMsgIdFilterGetStringList(const char *text) {
  Owned<StringList, qlxIntlFreeStringList> list{qlxIntlAllocStringList()};
  for (QlxStrTok rest = QlxStrTokIterator(text, kBlanks); QlxStrTokIterHasNext(rest);
       rest = QlxStrTokIterNext(rest)) {
    const OwnedStr word{QlxStrTokIterGet(rest)};
    if (!qlxIntlStringListAppend(list.get(), word.get())) return nullptr;
  }
  return list.release();
}

void *QlxMsgIdFilterFAllocVars(void) {
  Owned<MsgIdFilterVars, QlxMsgIdFilterFFreeVars> vars{
      static_cast<MsgIdFilterVars *>(OslMemoryCalloc(1, sizeof(MsgIdFilterVars)))};
  if (!vars) return nullptr;
  vars->mode = kBlock;
  vars->patterns = QlxMsgIdFilterGetStringList(kDefaultPatterns);
  vars->lastTimes = qlxIntlAllocStringToStringMap();
  vars->idFormatter = qlxIntlGetObject("msgFormatter", "qlx_xmlformatter");
  return vars->patterns && vars->lastTimes ? vars.release() : nullptr;
}

void QlxMsgIdFilterFFreeVars(void *block) {
  auto *vars = static_cast<MsgIdFilterVars *>(block);
  if (!vars) return;
  qlxIntlFreeStringList(vars->patterns);
  qlxIntlReleaseObject(vars->idFormatter);
  qlxIntlFreeStringToStringMap(vars->lastTimes);
  OslMemoryFree(vars);
}

// ---- Configuration. A key without a value leaves its setting.

static void applyMode(QlxObject *filter, const char *key) {
  const char *word = qlxPeekMapProp(filter->props, key);
  if (word) varsOf(filter)->mode = OslStringICmp(word, "PASSTHRU") == 0 ? kPassThru : kBlock;
}

static void applyPatterns(QlxObject *filter, const char *key) {
  const char *text = qlxPeekMapProp(filter->props, key);
  StringList *patterns = text ? QlxMsgIdFilterGetStringList(text) : nullptr;
  if (!patterns) return;
  qlxIntlFreeStringList(varsOf(filter)->patterns);
  varsOf(filter)->patterns = patterns;
}

static void applyRepeatTime(QlxObject *filter, const char *key) {
  uint8_t found = 0;
  const int64_t value = qlxPropStrToInt64(qlxPeekMapProp(filter->props, key), &found);
  if (found) varsOf(filter)->repeatTime = value;
}

static constexpr ConfigKey kMsgIdFilterKeys[] = {
    {"mode", applyMode},
    {"msgIds", applyPatterns},
    {"msgIdRepeatTime", applyRepeatTime},
};

void QlxMsgIdFilterFCfgChange(QlxObject *filter, const char *key) {
  if (!key || !varsOf(filter)) return;
  if (!qlxApplyConfigKey(kMsgIdFilterKeys, filter, key)) QlxBasicObjectFCfgChange(filter, key);
}

// ---- The test

uint8_t QlxMsgIdFilterMatchMsgId(StringList *patterns, const char *id) {
  if (!patterns || !id) return 0;
  for (const StringListNode *it = patterns->head; it; it = it->next) {
    if (QlxPatternMatch(it->value, id)) return 1;
  }
  return 0;
}

// An event's time as a whole number; one that is out of range is the nearest, no number is 0.
static int64_t wholeTime(double time) {
  using Limits = std::numeric_limits<int64_t>;
  constexpr double kPastMax = 9223372036854775808.0;  // 2 to the power 63
  if (time >= kPastMax) return Limits::max();
  if (time <= -kPastMax) return Limits::min();
  return time == time ? static_cast<int64_t>(time) : 0;
}

// The end of the interval in which an identifier repeats; one that is out of range is the largest.
static int64_t repeatEnd(int64_t last, int64_t repeatTime) {
  int64_t end = 0;
  const bool overflows = __builtin_add_overflow(last, repeatTime, &end);
  return overflows ? std::numeric_limits<int64_t>::max() : end;
}

// Whether the event's identifier passed less than the repeat time ago; stores the event's time
// when it did not. Deliberate: a blocked repeat does not extend the interval.
static bool isRepeat(MsgIdFilterVars *vars, const Event *event) {
  const int64_t now = wholeTime(event->time);
  if (const char *stored = qlxPeekMapProp(vars->lastTimes, event->messageId)) {
    const int64_t last = qlxPropStrToInt64(stored, nullptr);  // no number: 0
    if (repeatEnd(last, vars->repeatTime) > now) return true;
  }
  char text[24];
  std::snprintf(text, sizeof text, "%" PRId64, now);
  qlxIntlStringToStringMapPut(vars->lastTimes, event->messageId, text);
  return false;
}

uint8_t QlxMsgIdFilterFIsLoggable(QlxObject *filter, Event *event, va_list *args) {
  if (!filter || !event) return 0;
  MsgIdFilterVars *vars = varsOf(filter);
  if (!vars) return 1;
  qlxPDXMLUFormatterCacheMessageID(vars->idFormatter, event, args);
  const bool matches = QlxMsgIdFilterMatchMsgId(vars->patterns, event->messageId);
  if (matches == (vars->mode == kBlock)) return 0;
  const bool hasId = event->messageId && *event->messageId;
  return !(hasId && vars->repeatTime > 0 && isRepeat(vars, event));
}

const ObjClass qlxMsgIdFilterClass = {
    .kind = Filter,
    .name = "qlx_msgidfilter",
    .description = nullptr,
    .op1 = {.fProcess = QlxBasicFilterFProcess},
    .op2 = {.fIsLoggable = QlxMsgIdFilterFIsLoggable},
    .op3 = {.fLog = QlxBasicObjectFLog},
    .fAllocVars = QlxMsgIdFilterFAllocVars,
    .fFreeVars = QlxMsgIdFilterFFreeVars,
    .fCfgChange = QlxMsgIdFilterFCfgChange,
    .own = &kTakesNotes,
};
