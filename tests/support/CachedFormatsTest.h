// A test that starts and ends without formats that are held, in American English and UTC.
#ifndef QLX_TESTS_CACHEDFORMATSTEST_H
#define QLX_TESTS_CACHEDFORMATSTEST_H

#include <gtest/gtest.h>

#include "support/IcuDefaults.h"
#include "text/QlxFormatCache.h"

class CachedFormatsTest : public ::testing::Test {
 protected:
  void SetUp() override {
    qlxDropCachedFormats();
    ASSERT_TRUE(IcuDefaults::setLocale("en_US"));
    ASSERT_TRUE(IcuDefaults::setZone(u"UTC"));
  }
  void TearDown() override { qlxDropCachedFormats(); }

  IcuDefaults defaults_;
};

#endif
