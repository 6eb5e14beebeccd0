// The host name that this test program has in place of the system's, whose resolver may take
// seconds for each question. It is defined, with the calls that answer it, in QlxPDLoggerTest.cpp.
#ifndef QLX_TESTS_HOSTNAME_H
#define QLX_TESTS_HOSTNAME_H

extern const char *madeUpName;  // null: the system's own

#endif
