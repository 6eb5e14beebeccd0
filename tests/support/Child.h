// Processes of a test: they meet at signals, and what is expected in a child counts in the test.
#ifndef QLX_TESTS_CHILD_H
#define QLX_TESTS_CHILD_H

#include <gtest/gtest.h>

#include <csignal>
#include <cstdio>
#include <cstdlib>
#include <unistd.h>

#include <sys/wait.h>

// Given in one process and awaited in another; made before they part.
class Signal {
 public:
  Signal() {
    if (pipe(ends_) != 0) std::abort();
  }
  ~Signal() {
    close(ends_[0]);
    close(ends_[1]);
  }
  Signal(const Signal &) = delete;
  Signal &operator=(const Signal &) = delete;

  void give() const {
    if (write(ends_[1], "", 1) != 1) std::abort();
  }
  void await() const {
    char token;
    if (read(ends_[0], &token, 1) != 1) std::abort();
  }

 private:
  int ends_[2];
};

// A child that makes a call and ends without cleaning up, as one that is killed does.
class Child {
 public:
  static constexpr unsigned kHangSeconds = 60;  // until one that hangs is ended

  template <typename Call>
  explicit Child(Call call) {
    std::fflush(nullptr);
    id_ = fork();
    if (id_ != 0) return;
    alarm(kHangSeconds);
    call();
    std::fflush(nullptr);
    _exit(::testing::Test::HasFailure() ? 1 : 0);
  }
  ~Child() {
    if (id_ <= 0) return;
    ::kill(id_, SIGKILL);
    waitStatus();
  }
  Child(const Child &) = delete;
  Child &operator=(const Child &) = delete;

  pid_t id() const { return id_; }
  void send(int signal) const { ::kill(id_, signal); }

  // Until it stops itself.
  void awaitStop() const {
    int status = 0;
    EXPECT_EQ(waitpid(id_, &status, WUNTRACED), id_);
    EXPECT_TRUE(WIFSTOPPED(status));
  }

  // Exit status of the ended child, or minus the signal that ended it.
  int end() {
    const int status = waitStatus();
    id_ = -1;
    return WIFEXITED(status) ? WEXITSTATUS(status) : -WTERMSIG(status);
  }

  // The caller has waited for its end.
  void forget() { id_ = -1; }

  int kill() {
    send(SIGKILL);
    return end();
  }

 private:
  int waitStatus() const {
    int status = 0;
    EXPECT_EQ(waitpid(id_, &status, 0), id_);
    return status;
  }

  pid_t id_;
};

// Does something in a child, which a lock that stays behind ends by its alarm.
template <typename Use>
void expectNoHang(Use use) {
  Child child(use);
  EXPECT_EQ(child.end(), 0);
}

#endif
