// An open toolkit for a scope, for tests that are no ToolkitTest.
#ifndef QLX_TESTS_OPENTOOLKIT_H
#define QLX_TESTS_OPENTOOLKIT_H

#include <gtest/gtest.h>

#include <qlx/toolkit.h>

class OpenToolkit {
 public:
  explicit OpenToolkit(const char *configFile = nullptr) {
    EXPECT_EQ(QlxOpenToolkit(configFile, nullptr), 1);
  }
  ~OpenToolkit() { QlxCloseToolkit(); }
  OpenToolkit(const OpenToolkit &) = delete;
  OpenToolkit &operator=(const OpenToolkit &) = delete;
};

#endif
