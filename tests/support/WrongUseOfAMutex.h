// Skips a test that uses a mutex wrongly where the thread sanitizer would end it for that.
#ifndef QLX_TESTS_WRONGUSEOFAMUTEX_H
#define QLX_TESTS_WRONGUSEOFAMUTEX_H

#include <gtest/gtest.h>

#if defined(__SANITIZE_THREAD__)
#define WRONG_USE_OF_A_MUTEX() GTEST_SKIP() << "the thread sanitizer reports the wrong use itself"
#elif defined(__has_feature)
#if __has_feature(thread_sanitizer)
#define WRONG_USE_OF_A_MUTEX() GTEST_SKIP() << "the thread sanitizer reports the wrong use itself"
#endif
#endif
#ifndef WRONG_USE_OF_A_MUTEX
#define WRONG_USE_OF_A_MUTEX() static_assert(true)
#endif

#endif
