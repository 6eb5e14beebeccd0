/**
 * @file
 * Message identifiers: a prefix of letters, a number and a severity at the start of a message's
 * text, as in "ABC0001I Started".
 */
#ifndef QLX_KMSID_H
#define QLX_KMSID_H

#include <qlx/types.h>

QLX_BEGIN_DECLS

/** What the start of a text was recognised as. */
typedef struct CxKMSIDInfo {
  const char *version; /**< static: the layout's name; "" when nothing was recognised */
  int32_t number;      /**< the layout's number, or 0 */
  int32_t length;      /**< characters of the identifier, 7 to 10, or 0 */
  char id[10];         /**< the identifier; terminated when it is shorter than the array */
  char severity;       /**< 'I', 'W' or 'E'. Deliberate: 0 for an identifier of ten characters */
} CxKMSIDInfo;

/**
 * Recognises a message identifier. Letters may have any case, the severity is upper case, and any
 * text may follow.
 *
 * @param text  borrowed; null is recognised as nothing. Takes no lock.
 */
QLX_API CxKMSIDInfo CxParseKMSID(const char *text);

QLX_END_DECLS

#endif
