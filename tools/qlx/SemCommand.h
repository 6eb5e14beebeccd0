// `qlx sem`: the semaphore sets of multi-process file handlers, which the library never removes.
#ifndef QLX_TOOLS_SEMCOMMAND_H
#define QLX_TOOLS_SEMCOMMAND_H

#include <optional>
#include <string>

#include <sys/types.h>

// The key in decimal, as a configuration has it, or in hexadecimal with 0x, as ipcs shows it.
// Nothing for other texts, and for 0, which names no set.
std::optional<key_t> readSemaphoreKey(const std::string &text);

// One line for the set of the key; without a key, for each set that looks like a handler's. Returns
// the exit status of the command, as the next one does.
int listSemaphores(std::optional<key_t> key);

// Removes the set of the key, whoever holds it or waits for it.
int removeSemaphore(key_t key);

#endif
