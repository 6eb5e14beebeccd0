// Localized messages: made, copied, and bound to text.
#include "QlxI18Msg.h"

#include <cstring>

#include <unicode/ustdio.h>
#include <unicode/ustring.h>

#include <qlx/buffers.h>
#include <qlx/class/containers.h>
#include <qlx/memory.h>
#include <qlx/message.h>
#include <qlx/ustring.h>

#include "text/QlxBundleCache.h"
#include "text/QlxMessageCache.h"
#include "object/QlxLocked.h"
#include "util/CxOwned.h"

using OwnedMsg = Owned<I18Msg, qlxIntlFreeI18Msg>;

// Whether everything that the source has was copied.
static bool isWhole(const I18Msg *copy, const char *bundle, const char *key, const UChar *text,
                    const ParmList *parms) {
  return (copy->bundle || !bundle) && (copy->key || !key) && (copy->text || !text) &&
         (copy->parms || !parms);
}

static I18Msg *allocMsg(const char *bundle, const char *key, const UChar *text, ParmList *parms) {
  OwnedMsg message{static_cast<I18Msg *>(OslMemoryCalloc(1, sizeof(I18Msg)))};
  if (!message) return nullptr;
  message->bundle = OslStringDup(bundle);
  message->key = OslStringDup(key);
  message->text = CxUStringDup(text);
  if (parms) message->parms = qlxIntlCopyParmList(parms);
  return isWhole(message.get(), bundle, key, text, parms) ? message.release() : nullptr;
}

I18Msg *qlxIntlAllocUI18Msg(const char *bundle, const char *key, const UChar *text) {
  return allocMsg(bundle, key, text, nullptr);
}

// Deliberate: the copy shares the locale's string. Both are marked, so that neither's owner frees
// it.
I18Msg *qlxIntlCopyI18Msg(I18Msg *message) {
  if (!message) return nullptr;
  I18Msg *copy = allocMsg(message->bundle, message->key, message->text, message->parms);
  if (!copy) return nullptr;
  copy->locale = message->locale;
  copy->error = message->error;
  if (message->locale) copy->shared = message->shared = 1;
  return copy;
}

void qlxIntlFreeI18Msg(I18Msg *message) {
  if (!message) return;
  OslMemoryFree(message->bundle);
  OslMemoryFree(message->key);
  OslMemoryFree(message->text);
  qlxIntlFreeParmList(message->parms);
  OslMemoryFree(message);
}

ParmList *qlxGetI18MsgParmList(I18Msg *message) {
  if (!message) return nullptr;
  if (!message->parms) message->parms = qlxIntlAllocParmList();
  return message->parms;
}

void qlxSetI18MsgLocale(I18Msg *message, const char *locale) {
  if (!message) return;
  char *copy = OslStringDup(locale);  // first: it may be the message's own
  OslMemoryFree(message->locale);
  message->locale = copy;
  message->shared = 0;
}

// Appends the message's text. An empty text and a message without a pattern are no failures.
static uint32_t bindTo(I18Msg *message, va_list *args, CxUStringBuff *text, UErrorCode *status) {
  if (!message->bundle) {
    if (!message->text) return 0;
    return qlxAppendCachedMessage(text, message->locale, message->text, args, status);
  }
  return qlxAppendBundleMessage(text, {message->bundle, message->key, message->locale}, args,
                                status);
}

uint8_t qlxIntlBindI18MsgTo(I18Msg *message, va_list *args, CxUStringBuff *text) {
  if (!message) return 0;
  UErrorCode status = U_ZERO_ERROR;
  const uint32_t appended = bindTo(message, args, text, &status);
  if (U_FAILURE(status)) message->error = status;
  return appended > 0;
}

UChar *qlxIntlBindUI18Msg(I18Msg *message, va_list *args) {
  CxUStringBuff text{};
  if (qlxIntlBindI18MsgTo(message, args, &text)) return CxUStringBuffTakeUStr(&text);
  CxUStringBuffDiscard(&text);
  return nullptr;
}

void qlxI18PrintUCharAsLocal(FILE *stream, const UChar *text) {
  if (!stream || !text) return;
  const icu::LocalUFILEPointer local{u_finit(stream, nullptr, nullptr)};
  if (local.isNull()) return;
  u_file_write(text, u_strlen(text), local.getAlias());
  u_fputc(u'\n', local.getAlias());
}

// Public functions

I18Msg *QlxAllocUI18Msg(const char *bundle, const char *key, const UChar *text) {
  return qlxLocked<qlxIntlAllocUI18Msg>(bundle, key, text);
}

I18Msg *QlxCopyI18Msg(I18Msg *message) {
  return qlxLocked<qlxIntlCopyI18Msg>(message);
}

void QlxFreeI18Msg(I18Msg *message) {
  qlxLocked<qlxIntlFreeI18Msg>(message);
}

UChar *QlxBindUI18Msg(I18Msg *message, va_list *args) {
  return qlxLocked<qlxIntlBindUI18Msg>(message, args);
}
