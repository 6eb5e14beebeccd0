// A test with an open toolkit: opened without a file before each test, closed after it.
#ifndef QLX_TESTS_TOOLKITTEST_H
#define QLX_TESTS_TOOLKITTEST_H

#include <gtest/gtest.h>

#include <string>

#include <qlx/qlx.h>

#include "QlxObjConfig.h"
#include "QlxObject.h"
#include "object/QlxLocked.h"
#include "support/FailingMemory.h"
#include "support/Handle.h"

class ToolkitTest : public ::testing::Test {
 protected:
  void SetUp() override { ASSERT_EQ(QlxOpenToolkit(nullptr, nullptr), 1); }
  void TearDown() override { QlxCloseToolkit(); }

  static Handle get(const char *name, const char *className = nullptr) {
    return Handle{QlxGetObject(name, className)};
  }

  // Sets a property of a configuration, made when it is missing.
  static void configure(const char *cfg, const char *key, const char *value) {
    ObjCfg *found = QlxLogMgrGetCfg(cfg);
    ASSERT_NE(found, nullptr);
    EXPECT_EQ(QlxSetObjCfgProp(found, key, value), 1);
    QlxReleaseObjCfg(found);
  }

  // Takes a property away and tells the class, which then reads it as absent.
  static void clear(const Handle &object, const char *key) {
    const ApiLock lock;
    if (object->props) qlxIntlStringToStringMapRem(object->props, key);
    object->objClass->fCfgChange(object.get(), key);
  }

  // An object for whose variables there was no memory.
  static Handle getWithoutVariables(const char *name, const char *className) {
    constexpr uint64_t kMost = 100;  // allocations of one that is made whole
    for (uint64_t n = 1; n < kMost; ++n) {
      FailingMemory memory;
      memory.failOnce(n);
      Handle made = get(name, className);
      if (made && !made->vars) return made;
    }
    ADD_FAILURE() << className << " always has variables";
    return nullptr;
  }

  // A string result as std::string; frees it. "<null>" for null.
  static std::string take(char *text) {
    const std::string taken = text ? text : "<null>";
    OslMemoryFree(text);
    return taken;
  }
};

#endif
