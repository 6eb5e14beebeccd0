// In place of the C library's gethostname and gethostbyname_r, for the whole program of the tests:
// a test may make up the host's names. A resolver may take seconds for each question.
#ifndef QLX_TESTS_HOSTNAME_H
#define QLX_TESTS_HOSTNAME_H

#include <string>

extern const char *madeUpName;          // null: the system's own names; empty: the host has none
extern std::string madeUpOfficialName;  // what the resolver finds; empty: nothing

#endif
