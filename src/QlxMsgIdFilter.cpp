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

#include "QlxClasses.h"
#include "QlxConfigKeys.h"
#include "QlxObject.h"
#include "QlxProps.h"

namespace {

constexpr uint32_t kBlock = 1, kPassThru = 2;
constexpr const char *kDefaultPatterns = "*W *I";
constexpr const char *kBlanks = " \t\n\r";

struct MsgIdFilterVars {
  uint32_t mode;                 // kBlock: block what matches; kPassThru: pass only what matches
  StringList *patterns;          // owned
  QlxObject *idFormatter;        // counted: the shared object "msgFormatter"
  int64_t repeatTime;            // milliseconds of event time; 0 and less: no suppression
  StringToStringMap *lastTimes;  // owned: identifier to the time of its last passed event
};

MsgIdFilterVars *varsOf(QlxObject *filter) {
  return filter ? static_cast<MsgIdFilterVars *>(filter->vars) : nullptr;
}

}  // namespace

StringList *QlxMsgIdFilterGetStringList(const char *text) {
  StringList *list = qlxIntlAllocStringList();
  for (QlxStrTok rest = QlxStrTokIterator(text, kBlanks); list && QlxStrTokIterHasNext(rest);
       rest = QlxStrTokIterNext(rest)) {
    const OwnedStr token{QlxStrTokIterGet(rest)};
    qlxIntlStringListAppend(list, token.get());
  }
  return list;
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

// now - last, which may not fit, compared without overflowing.
static bool isRepeat(int64_t last, int64_t repeatTime, int64_t now) {
  int64_t end = 0;
  if (__builtin_add_overflow(last, repeatTime, &end)) end = std::numeric_limits<int64_t>::max();
  return end > now;
}

static int64_t wholeTime(double time) {
  constexpr double kLimit = 9.2e18;
  return time > -kLimit && time < kLimit ? static_cast<int64_t>(time) : 0;
}

// Whether the identifier was passed less than the repeat time ago; notes the time when it was not.
// Deliberate: a blocked repeat does not extend the interval.
static bool suppressRepeat(MsgIdFilterVars *vars, const Event *event) {
  const int64_t now = wholeTime(event->time);
  if (const char *text = qlxPeekMapProp(vars->lastTimes, event->messageId)) {
    const int64_t last = qlxPropStrToInt64(text, nullptr);  // no number: 0
    if (isRepeat(last, vars->repeatTime, now)) return true;
  }
  char text[24];
  std::snprintf(text, sizeof text, "%" PRId64, now);
  qlxIntlStringToStringMapPut(vars->lastTimes, event->messageId, text);
  return false;
}

uint8_t QlxMsgIdFilterFIsLoggable(QlxObject *filter, Event *event, va_list *args) {
  MsgIdFilterVars *vars = varsOf(filter);
  if (!filter || !event) return 0;
  if (!vars) return 1;
  qlxPDXMLUFormatterCacheMessageID(vars->idFormatter, event, args);
  const uint8_t matches = QlxMsgIdFilterMatchMsgId(vars->patterns, event->messageId);
  if (matches == (vars->mode == kBlock)) return 0;
  const bool hasId = event->messageId && *event->messageId;
  if (hasId && vars->repeatTime > 0 && suppressRepeat(vars, event)) return 0;
  return 1;
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
};
