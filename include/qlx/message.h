/**
 * @file
 * Localized messages: a bundle and a key that select a pattern in a locale, or the pattern itself,
 * bound to text with an argument list.
 *
 * For every function here: it takes the API lock, and gives null when the lock cannot be taken.
 * Returned text is new and the caller frees it with OslMemoryFree().
 */
#ifndef QLX_MESSAGE_H
#define QLX_MESSAGE_H

#include <qlx/types.h>

QLX_BEGIN_DECLS

/**
 * @param bundle  name or path of an ICU resource bundle, or null
 * @param key     key of the pattern in the bundle, or null
 * @param text    the pattern when bundle is null; may be null
 * @return a new message with copies of the three, for QlxFreeI18Msg(); null when memory ran out
 */
QLX_API I18Msg *QlxAllocUI18Msg(const char *bundle, const char *key, const UChar *text);

/**
 * Copies a message. Deliberate: the copy shares the locale's string, so set a locale only on a
 * message that has no copy.
 *
 * @return a new message for QlxFreeI18Msg(); null for null or when memory ran out
 */
QLX_API I18Msg *QlxCopyI18Msg(I18Msg *message);

/** Frees a message, but not its locale's string, which copies may share. Null is ignored. */
QLX_API void QlxFreeI18Msg(I18Msg *message);

/**
 * Binds a message: looks the pattern up in the bundle (when the bundle does not open, once more by
 * the part of its name after the last "/") and formats it with the arguments.
 *
 * @param args  borrowed and left as it was; of the types that the pattern reads, as for
 *              u_vformatMessage(). Null is an empty list: the pattern's arguments then read as
 *              zeros, and one that is a text, or has a number above 63, fails with
 *              U_ILLEGAL_ARGUMENT_ERROR
 *
 * The same error has a pattern whose messages nest deeper than 8 levels (those of choice, plural
 * and select below the pattern itself), so that every pattern can be formatted on a stack of 64
 * KiB. Dates, times, plurals, worded numbers number skeletons (::) and the long names of currencies
 * (three currency signs) have it when the locale's name is none: one that ICU's parser cannot read
 * or that is longer than ULOC_FULLNAME_CAPACITY, or its keywords than
 * ULOC_KEYWORD_AND_VALUES_CAPACITY. Where the default locale has such a name, so have all arguments
 * with a type, and bundles.
 *
 * @return the text, or null: on a failure, whose ICU code is then in message->error (a success does
 *         not clear it), and when the text is empty
 */
QLX_API UChar *QlxBindUI18Msg(I18Msg *message, va_list *args);

QLX_END_DECLS

#endif
