// The command qlx, started as a user starts it.
#ifndef QLX_TESTS_TOOL_PROCESS_H
#define QLX_TESTS_TOOL_PROCESS_H

#include <gtest/gtest.h>

#include <csignal>
#include <cstdlib>
#include <map>
#include <string>
#include <vector>

#include <fcntl.h>
#include <sys/wait.h>
#include <unistd.h>

struct Outcome {
  int status;  // exit status; the negative number of the signal that ended it
  std::string out, err;
};

// One run of the command. Its input is a pipe, or a descriptor that the test brings.
class Process {
 public:
  using Environment = std::map<std::string, std::string>;

  Process(std::vector<std::string> arguments, const std::string &folder,
          Environment environment = {}, int input = -1, int output = -1, int error = -1)
      : in_(input), out_(output), err_(error) {
    int pipes[3][2] = {{-1, -1}, {-1, -1}, {-1, -1}};
    for (auto &ends : pipes) EXPECT_EQ(pipe2(ends, O_CLOEXEC), 0);
    const int given[] = {input, output, error};
    const int own[] = {pipes[0][0], pipes[1][1], pipes[2][1]};
    arguments.insert(arguments.begin(), QLX_COMMAND);
    pid_ = fork();
    if (pid_ == 0) {
      for (int i = 0; i < 3; ++i) dup2(given[i] >= 0 ? given[i] : own[i], i);
      start(arguments, folder, environment);
    }
    for (const int end : own) close(end);
    in_ = pipes[0][1];
    out_ = pipes[1][0];
    err_ = pipes[2][0];
  }
  ~Process() {
    closeInput();
    close(out_);
    close(err_);
  }
  Process(const Process &) = delete;
  Process &operator=(const Process &) = delete;

  void write(const std::string &text) {
    for (size_t at = 0; at < text.size();) {
      const ssize_t count = ::write(in_, text.data() + at, text.size() - at);
      ASSERT_GT(count, 0);
      at += count;
    }
  }
  void closeInput() {
    if (in_ >= 0) close(in_);
    in_ = -1;
  }
  void signal(int number) { kill(pid_, number); }

  // Reads standard output until it ends with the text.
  void waitForOutput(const std::string &end) {
    while (!outcome_.out.ends_with(end)) ASSERT_TRUE(readSome(out_, outcome_.out)) << outcome_.out;
  }

  Outcome finish() {
    closeInput();
    while (readSome(out_, outcome_.out)) continue;
    while (readSome(err_, outcome_.err)) continue;
    int status = 0;
    waitpid(pid_, &status, 0);
    outcome_.status = WIFEXITED(status) ? WEXITSTATUS(status) : -WTERMSIG(status);
    return outcome_;
  }

 private:
  [[noreturn]] static void start(std::vector<std::string> &arguments, const std::string &folder,
                                 const Environment &environment) {
    for (const char *name : {"LC_ALL", "LC_CTYPE", "LC_MESSAGES", "LANG"}) unsetenv(name);
    setenv("LC_ALL", "C.UTF-8", 1);
    for (const auto &[name, value] : environment) setenv(name.c_str(), value.c_str(), 1);
    std::vector<char *> argv;
    for (std::string &argument : arguments) argv.push_back(argument.data());
    argv.push_back(nullptr);
    if (chdir(folder.c_str()) == 0) execv(argv[0], argv.data());
    _exit(127);
  }

  static bool readSome(int descriptor, std::string &text) {
    char buffer[1 << 16];
    const ssize_t count = read(descriptor, buffer, sizeof buffer);
    if (count > 0) text.append(buffer, count);
    return count > 0;
  }

  pid_t pid_;
  int in_, out_, err_;
  Outcome outcome_ = {};
};

#endif
