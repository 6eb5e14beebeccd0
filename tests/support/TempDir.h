// A folder of a test's own under TMPDIR, removed with all that is in it.
#ifndef QLX_TESTS_TEMPDIR_H
#define QLX_TESTS_TEMPDIR_H

#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <iterator>
#include <string>
#include <string_view>

class TempDir {
 public:
  TempDir() {
    std::string pattern = std::filesystem::temp_directory_path() / "qlxtestXXXXXX";
    if (!mkdtemp(pattern.data())) std::abort();  // else paths would begin at the root
    dir_ = pattern;
  }
  ~TempDir() {
    std::error_code ignored;
    std::filesystem::remove_all(dir_, ignored);
  }
  TempDir(const TempDir &) = delete;
  TempDir &operator=(const TempDir &) = delete;

  std::string path(std::string_view name = "") const {
    return name.empty() ? dir_ : dir_ + "/" + std::string(name);
  }

  bool exists(std::string_view name) const { return std::filesystem::exists(path(name)); }

  // The whole file as it is, "<none>" without one.
  std::string read(std::string_view name) const {
    std::ifstream in(path(name), std::ios::binary);
    if (!in) return "<none>";
    return {std::istreambuf_iterator<char>(in), std::istreambuf_iterator<char>()};
  }

  // Writes a file anew and returns its path.
  std::string write(std::string_view name, std::string_view content) const {
    std::ofstream(path(name), std::ios::binary | std::ios::trunc) << content;
    return path(name);
  }

 private:
  std::string dir_;
};

#endif
