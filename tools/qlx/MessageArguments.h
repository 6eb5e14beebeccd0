// The arguments of a localized message, from words of the command line.
#ifndef QLX_TOOLS_MESSAGEARGUMENTS_H
#define QLX_TOOLS_MESSAGEARGUMENTS_H

#include <cstdint>
#include <optional>
#include <string>
#include <variant>
#include <vector>

// A text, a {n,number,integer}, or any other number, choice or date.
using MessageArgument = std::variant<std::u16string, int32_t, double>;

static constexpr size_t kMaxMessageArguments = 6;

/**
 * Reads the words as the types that the message's pattern has for its arguments, so that a word
 * never reaches the formatter as something else. The pattern is that of the default locale; words
 * past its last argument are dropped. Without a pattern no word is needed: binding will fail, and
 * say so.
 *
 * Returns nothing and a problem when words are missing or are not the numbers that they must be.
 */
std::optional<std::vector<MessageArgument>> readMessageArguments(
    const char *bundle, const char *key, const std::vector<std::string> &words,
    std::string &problem);

#endif
