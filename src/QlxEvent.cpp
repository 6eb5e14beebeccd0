// Events: the record of one log request, and the typed family over its properties.
#include "QlxEvent.h"

#include <qlx/class/containers.h>
#include <qlx/event.h>
#include <qlx/memory.h>
#include <qlx/props.h>
#include <qlx/system.h>

static void replaceString(char **target, const char *value) {
  char *copy = OslStringDup(value);  // first: the value may be the stored one
  OslMemoryFree(*target);
  *target = copy;
}

Event *QlxVaAllocUEvent(int32_t level, const char *bundle, const char *key, const UChar *text) {
  auto *event = static_cast<Event *>(OslMemoryCalloc(1, sizeof(Event)));
  if (!event) return nullptr;
  event->time = CxSystemGetTimestamp();
  event->message = qlxIntlAllocUI18Msg(bundle, key, text);
  event->level = level;
  event->isMessage = bundle != nullptr;
  event->status = {'-', 0};
  return event;
}

void QlxFreeEvent(Event *event) {
  if (!event) return;
  // The event owns its message alone, unless somebody copied it: then the copy shares the locale.
  if (event->message && !event->message->shared) qlxSetI18MsgLocale(event->message, nullptr);
  qlxIntlFreeI18Msg(event->message);
  qlxIntlFreeStringToStringMap(event->props);
  OslMemoryFree(event->messageId);
  OslMemoryFree(event->locale);
  OslMemoryFree(event);
}

double QlxGetEventTime(Event *event) {
  return event ? event->time : 0.0;
}

int32_t QlxGetEventLevel(Event *event) {
  return event ? event->level : UNSPECIFIED;
}

char *QlxGetEventMessageId(Event *event) {
  return event ? OslStringDup(event->messageId) : nullptr;
}

void QlxSetEventMessageId(Event *event, const char *messageId) {
  if (event) replaceString(&event->messageId, messageId);
}

char *qlxGetEventLocale(Event *event) {
  return event ? OslStringDup(event->locale) : nullptr;
}

void qlxSetEventLocale(Event *event, const char *locale) {
  if (event) replaceString(&event->locale, locale);
}

uint8_t QlxGetEventIsMessage(Event *event) {
  return event ? event->isMessage : 0;
}

void QlxSetEventIsMessage(Event *event, uint8_t flag) {
  if (event) event->isMessage = flag;
}

UChar *QlxBindEventUMsg(Event *event, fBindMsg bind, va_list *args) {
  if (!event || !bind) return nullptr;
  qlxUseEventLocale(event);
  return bind(event->message, args);
}

// ---- Properties

StringToStringMap *qlxFetchEventPropMap(Event *event) {
  if (!event) return nullptr;
  if (!event->props) event->props = qlxIntlAllocStringToStringMap();
  return event->props;
}

static StringToStringMap *propsOf(Event *event) {
  return event ? event->props : nullptr;
}

char *QlxGetEventProp(Event *event, const char *key, uint8_t *found) {
  return QlxGetMapProp(propsOf(event), key, found);
}

uint8_t QlxSetEventProp(Event *event, const char *key, const char *value) {
  return QlxSetMapProp(qlxFetchEventPropMap(event), key, value);
}

uint8_t QlxSetEventPropBool(Event *event, const char *key, uint8_t value) {
  return QlxSetMapPropBool(qlxFetchEventPropMap(event), key, value);
}

#define QLX_EVENT_GETTER(Type, T)                                           \
  T QlxGetEventProp##Type(Event *event, const char *key, uint8_t *found) {  \
    return static_cast<T>(QlxGetMapProp##Type(propsOf(event), key, found)); \
  }

#define QLX_EVENT_PROPERTY(Type, T)                                    \
  QLX_EVENT_GETTER(Type, T)                                            \
  void QlxSetEventProp##Type(Event *event, const char *key, T value) { \
    QlxSetMapProp##Type(qlxFetchEventPropMap(event), key, value);      \
  }

QLX_EVENT_GETTER(Bool, uint8_t)  // its setter answers whether it stored
QLX_EVENT_PROPERTY(Int, int32_t)
QLX_EVENT_PROPERTY(Long, int32_t)  // Deliberate: 32 bits wide here; objects keep 64
QLX_EVENT_PROPERTY(Float, float)
QLX_EVENT_PROPERTY(Double, double)

#undef QLX_EVENT_PROPERTY
#undef QLX_EVENT_GETTER
