// Another working directory for a scope.
#ifndef QLX_TESTS_WORKINGDIR_H
#define QLX_TESTS_WORKINGDIR_H

#include <filesystem>
#include <string>

class WorkingDir {
 public:
  explicit WorkingDir(const std::string &dir) : before_(std::filesystem::current_path()) {
    std::filesystem::current_path(dir);
  }
  ~WorkingDir() {
    std::error_code ignored;
    std::filesystem::current_path(before_, ignored);
  }
  WorkingDir(const WorkingDir &) = delete;
  WorkingDir &operator=(const WorkingDir &) = delete;

 private:
  std::filesystem::path before_;
};

#endif
