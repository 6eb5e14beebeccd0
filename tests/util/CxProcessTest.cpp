#include <gtest/gtest.h>

#include <climits>
#include <cstdlib>
#include <cstring>
#include <string>
#include <sys/wait.h>
#include <unistd.h>

#include "support/Status.h"
#include "support/TempDir.h"
#include "util/CxProcess.h"

namespace {

constexpr int kProgramNotStarted = 77;  // the exit status of a child whose program did not start
constexpr int kWrongInChild = 78;

// What CxProcessCreate() answered, and how the child ended; never returns in the child.
struct Program {
  Program(const char *path, std::initializer_list<const char *> words) {
    std::vector<char *> arguments;
    for (const char *word : words) arguments.push_back(const_cast<char *>(word));
    arguments.push_back(nullptr);
    const pid_t parent = getpid();
    status = CxProcessCreate(&id, path, arguments.data());
    if (getpid() != parent) {
      _exit(status == kSuccess && id == -1 ? kProgramNotStarted : kWrongInChild);
    }
    int ended = 0;
    if (id > 0 && waitpid(static_cast<pid_t>(id), &ended, 0) == id && WIFEXITED(ended)) {
      exitStatus = WEXITSTATUS(ended);
    }
  }
  CxStatus status{};
  int64_t id = 12345;
  int exitStatus = -1;
};

TEST(CxProcessTest, GetEnvGivesTheValueOrNull) {
  setenv("QLX_TEST_VARIABLE", "a value", 1);
  EXPECT_STREQ(CxProcessGetEnv("QLX_TEST_VARIABLE"), "a value");
  unsetenv("QLX_TEST_VARIABLE");
  EXPECT_EQ(CxProcessGetEnv("QLX_TEST_VARIABLE"), nullptr);
  EXPECT_EQ(CxProcessGetEnv(nullptr), nullptr);
}

TEST(CxProcessTest, GetCurrentIDGivesThisProcess) {
  EXPECT_EQ(CxProcessGetCurrentID(), getpid());
}

TEST(CxProcessTest, GetCwdGivesTheWorkingDirectory) {
  char buffer[PATH_MAX] = "left over";
  EXPECT_EQ(CxProcessGetCwd(buffer, sizeof buffer), kSuccess);
  EXPECT_EQ(std::filesystem::path(buffer), std::filesystem::current_path());
}

TEST(CxProcessTest, GetCwdIntoTooSmallABufferFailsAndEmptiesIt) {
  char buffer[2] = "x";
  const std::filesystem::path before = std::filesystem::current_path();
  const TempDir dir;
  std::filesystem::current_path(dir.path());
  EXPECT_EQ(CxProcessGetCwd(buffer, sizeof buffer), failure(ERANGE));
  EXPECT_STREQ(buffer, "");
  std::filesystem::current_path(before);
}

TEST(CxProcessTest, GetCwdRefusesNoBufferAndNoSize) {
  EXPECT_EQ(CxProcessGetCwd(nullptr, 10), failure(22));
  EXPECT_EQ(CxProcessGetCwd(nullptr, 0), failure(22));
  char buffer[4] = "abc";
  EXPECT_EQ(CxProcessGetCwd(buffer, 0), failure(22));
  EXPECT_STREQ(buffer, "");
}

TEST(CxProcessTest, CreateStartsAProgramWithArgumentsAndEnvironment) {
  const TempDir dir;
  setenv("QLX_TEST_TARGET", dir.path("out").c_str(), 1);
  const Program run("/bin/sh",
                    {"sh", "-c", "printf %s \"$1\" > \"$QLX_TEST_TARGET\"", "sh", "hello"});
  unsetenv("QLX_TEST_TARGET");
  EXPECT_EQ(run.status, kSuccess);
  EXPECT_GT(run.id, 0);
  EXPECT_EQ(run.exitStatus, 0);
  EXPECT_EQ(dir.read("out"), "hello");
}

TEST(CxProcessTest, CreateReturnsWithSuccessInAChildWhoseProgramCannotStart) {
  const TempDir dir;
  const Program run(dir.path("missing").c_str(), {"missing"});
  EXPECT_EQ(run.status, kSuccess) << "the parent does not learn of it";
  EXPECT_EQ(run.exitStatus, kProgramNotStarted);
}

TEST(CxProcessTest, CreateDoesNotSearchForTheProgram) {
  const Program run("sh", {"sh", "-c", "exit 0"});
  EXPECT_EQ(run.exitStatus, kProgramNotStarted);
}

TEST(CxProcessTest, CreateRefusesWhatItNeeds) {
  char *const none[] = {nullptr};
  int64_t id = 5;
  EXPECT_EQ(CxProcessCreate(nullptr, "/bin/true", none), failure(22));
  EXPECT_EQ(CxProcessCreate(&id, nullptr, none), failure(22));
  EXPECT_EQ(CxProcessCreate(&id, "", none), failure(22));
  EXPECT_EQ(id, 5);
}

TEST(CxProcessTest, AFailedForkGivesItsErrorAndNoId) {
  char *const none[] = {nullptr};
  int64_t id = 5;
  const auto noFork = []() -> pid_t {
    errno = EAGAIN;
    return -1;
  };
  EXPECT_EQ(cxIntlProcessCreate(&id, "/bin/true", none, noFork), failure(EAGAIN));
  EXPECT_EQ(id, -1);
}

TEST(CxProcessTest, ReleaseDoesNothingButRefuseZero) {
  EXPECT_EQ(CxProcessRelease(0), failure(22));
  EXPECT_EQ(CxProcessRelease(-1), kSuccess);
  EXPECT_EQ(CxProcessRelease(INT64_MAX), kSuccess);
}

TEST(CxProcessTest, ReleaseNeitherWaitsForAChildNorSignalsIt) {
  int pipeEnds[2];
  ASSERT_EQ(pipe(pipeEnds), 0);
  const pid_t child = fork();
  ASSERT_NE(child, -1);
  if (child == 0) {  // ends with 3 when the pipe does
    close(pipeEnds[1]);
    char byte;
    _exit(read(pipeEnds[0], &byte, 1) == 0 ? 3 : 4);
  }
  EXPECT_EQ(CxProcessRelease(child), kSuccess);
  close(pipeEnds[1]);
  int ended = 0;
  EXPECT_EQ(waitpid(child, &ended, 0), child);
  EXPECT_TRUE(WIFEXITED(ended));
  EXPECT_EQ(WEXITSTATUS(ended), 3);
  close(pipeEnds[0]);
}

}  // namespace
