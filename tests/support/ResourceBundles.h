// Resource bundles that a test compiles for itself with ICU's genrb, which is looked for on PATH.
#ifndef QLX_TESTS_RESOURCEBUNDLES_H
#define QLX_TESTS_RESOURCEBUNDLES_H

#include <spawn.h>
#include <sys/wait.h>

#include <initializer_list>
#include <string>
#include <string_view>
#include <vector>

#include "support/TempDir.h"

class ResourceBundles {
 public:
  explicit ResourceBundles(std::string_view name = "messages") : name_(name) {
    std::filesystem::create_directory(path());
  }

  // What ures_open() takes: the bundle's path.
  std::string path() const { return dir_.path(name_); }

  // The folder that holds the bundle's.
  std::string folder() const { return dir_.path(); }

  // Writes and compiles the bundle of a locale ("root", "de", ...), whose content are resources in
  // genrb's syntax. False when genrb is missing or refuses them.
  bool add(const std::string &locale, const std::string &resources) const {
    const std::string source = name_ + "/" + locale + ".txt";
    dir_.write(source, locale + " {\n" + resources + "\n}\n");
    return run({"genrb", "--quiet", "-e", "UTF-8", "-d", path(), dir_.path(source)});
  }

 private:
  static bool run(std::initializer_list<std::string> words) {
    std::vector<char *> arguments;
    for (const std::string &word : words) arguments.push_back(const_cast<char *>(word.c_str()));
    arguments.push_back(nullptr);
    pid_t child;
    int status = 0;
    if (posix_spawnp(&child, arguments[0], nullptr, nullptr, arguments.data(), environ) != 0)
      return false;
    return waitpid(child, &status, 0) == child && WIFEXITED(status) && WEXITSTATUS(status) == 0;
  }

  TempDir dir_;
  std::string name_;
};

#endif
