#include "QlxBoundText.h"

#include "QlxEvent.h"
#include "QlxI18Msg.h"
#include "text/QlxMessageCache.h"
#include "util/CxUnits.h"

std::u16string_view BoundText::bind(Event *event, va_list *args) {
  const I18Msg *message = event->message;
  qlxUseEventLocale(event);
  if (message && !message->bundle && message->text) {
    const std::u16string_view whole{message->text, cxUnitsLength(message->text)};
    if (qlxIsPlainPattern(whole)) return whole;
  }
  CachedBuffer &buffer = buffer_.emplace();
  if (!qlxIntlBindI18MsgTo(event->message, args, buffer.get())) return u"";
  return buffer.text();
}
