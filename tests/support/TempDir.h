// A folder of the test's own, under TMPDIR or /tmp; removes itself with all that is in it.
#ifndef QLX_TESTS_TEMPDIR_H
#define QLX_TESTS_TEMPDIR_H

#include <gtest/gtest.h>

#include <algorithm>
#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <iterator>
#include <string>
#include <string_view>
#include <vector>

class TempDir {
 public:
  TempDir() {
    const char *const parent = getenv("TMPDIR");
    root_ = std::string(parent && *parent ? parent : "/tmp") + "/qlx-test-XXXXXX";
    if (!mkdtemp(root_.data())) {
      ADD_FAILURE() << "no temporary folder at " << root_;
      root_.clear();
    }
  }
  ~TempDir() {
    std::error_code ignored;
    if (!root_.empty()) std::filesystem::remove_all(root_, ignored);
  }
  TempDir(const TempDir &) = delete;
  TempDir &operator=(const TempDir &) = delete;

  // The folder's own path, without a separator at the end.
  const std::string &path() const { return root_; }

  std::string path(std::string_view name) const { return root_ + "/" + std::string(name); }

  bool has(const std::string &name) const {
    return std::filesystem::exists(std::filesystem::symlink_status(path(name)));
  }

  // The bytes of a file; a missing one fails the test.
  std::string read(const std::string &name) const {
    std::ifstream file(path(name), std::ios::binary);
    EXPECT_TRUE(file.is_open()) << "no file " << name;
    return {std::istreambuf_iterator<char>(file), std::istreambuf_iterator<char>()};
  }

  // Writes a file anew and returns its path.
  std::string write(const std::string &name, const std::string &bytes) const {
    std::ofstream file(path(name), std::ios::binary | std::ios::trunc);
    file.write(bytes.data(), static_cast<std::streamsize>(bytes.size()));
    file.close();
    EXPECT_FALSE(file.fail()) << "cannot write " << name;
    return path(name);
  }

  // The names in the folder itself, sorted.
  std::vector<std::string> list() const {
    std::vector<std::string> names;
    for (const auto &entry : std::filesystem::directory_iterator(root_)) {
      names.push_back(entry.path().filename().string());
    }
    std::sort(names.begin(), names.end());
    return names;
  }

 private:
  std::string root_;
};

#endif
