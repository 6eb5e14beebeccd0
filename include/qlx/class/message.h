/**
 * @file
 * Twins of qlx/message.h for class operations, with the API lock held by the caller, and helpers
 * that take no lock.
 */
#ifndef QLX_CLASS_MESSAGE_H
#define QLX_CLASS_MESSAGE_H

#include <stdio.h>

#include <qlx/types.h>

QLX_BEGIN_DECLS

QLX_API I18Msg *qlxIntlAllocUI18Msg(const char *bundle, const char *key, const UChar *text);
QLX_API I18Msg *qlxIntlCopyI18Msg(I18Msg *message);
QLX_API void qlxIntlFreeI18Msg(I18Msg *message);
QLX_API UChar *qlxIntlBindUI18Msg(I18Msg *message, va_list *args);

/** @return the message's parameter list, owned by it and made on first use; null for null */
QLX_API ParmList *qlxGetI18MsgParmList(I18Msg *message);

/** Replaces the locale by a copy (null clears it, and so does a lack of memory), for a message that
 *  has no copy. Null ignored. */
QLX_API void qlxSetI18MsgLocale(I18Msg *message, const char *locale);

/** Writes the text and a line feed in the default code page; null stream or text: nothing. */
QLX_API void qlxI18PrintUCharAsLocal(FILE *stream, const UChar *text);

QLX_END_DECLS

#endif
