// The sets are asked of the system directly: the command needs no toolkit for them.
#include "SemCommand.h"

#include <cerrno>
#include <charconv>
#include <csignal>
#include <cstdio>
#include <cstring>
#include <fstream>

#include <pwd.h>
#include <sys/ipc.h>
#include <sys/sem.h>

#include "ExitStatus.h"

// What multi-process file handlers make.
static constexpr unsigned long kSemaphores = 1;
static constexpr unsigned kMode = 0666;

// semctl()'s argument is the caller's to declare.
union SemaphoreArgument {
  semid_ds *about;
  seminfo *info;
};

template <typename Number>
static std::optional<key_t> readWhole(const char *from, const char *end, int base) {
  Number number;
  const auto [rest, error] = std::from_chars(from, end, number, base);
  if (error != std::errc() || rest != end || number == 0) return std::nullopt;
  return static_cast<key_t>(number);
}

std::optional<key_t> readSemaphoreKey(const std::string &text) {
  const char *const from = text.data(), *const end = from + text.size();
  if (text.starts_with("0x")) return readWhole<uint32_t>(from + 2, end, 16);
  return readWhole<int32_t>(from, end, 10);
}

static std::string named(key_t key) {
  char text[40];
  snprintf(text, sizeof text, "key %d (0x%08x)", key, static_cast<unsigned>(key));
  return text;
}

// ---- One set

static std::string ownerName(uid_t user) {
  const passwd *entry = getpwuid(user);
  return entry ? entry->pw_name : std::to_string(user);
}

// A process that has ended but that its parent has not waited for is a zombie: it is there no more.
static bool isZombie(pid_t process) {
  std::ifstream about("/proc/" + std::to_string(process) + "/stat");
  std::string line;
  std::getline(about, line);
  const size_t nameEnd = line.rfind(')');  // the name may have anything in it
  return nameEnd != line.npos && line.compare(nameEnd, 3, ") Z") == 0;
}

// As the process number is the system's to give again, "alive" may be another process by now.
static std::string processState(pid_t process) {
  if (process <= 0) return "none";  // or one that cannot be seen from this container
  const bool isThere = kill(process, 0) == 0 || errno == EPERM;
  return std::to_string(process) + (isThere && !isZombie(process) ? " alive" : " ended");
}

static void printHeading() {
  printf("%11s  %-10s %10s %5s %7s %4s  %-12s %s\n", "KEY", "HEX", "ID", "VALUE", "WAITING", "MODE",
         "OWNER", "LAST PROCESS");
}

// False, with the error number left, when the set cannot be read.
static bool printSet(int id, const semid_ds &about) {
  const int value = semctl(id, 0, GETVAL);
  const int waiting = semctl(id, 0, GETNCNT);
  const int process = semctl(id, 0, GETPID);
  if (value < 0 || waiting < 0 || process < 0) return false;
  const key_t key = about.sem_perm.__key;
  printf("%11d  0x%08x %10d %5d %7d %04o  %-12s %s\n", key, static_cast<unsigned>(key), id, value,
         waiting, about.sem_perm.mode & 0777U, ownerName(about.sem_perm.uid).c_str(),
         processState(process).c_str());
  return true;
}

static int printed() {
  return fflush(stdout) == 0 ? kSuccess : failed("standard output", strerror(errno));
}

// ---- Finding sets

static int listOurs() {
  seminfo info = {};
  const int last = semctl(0, 0, SEM_INFO, SemaphoreArgument{.info = &info});
  if (last < 0) return failed("semaphore sets", strerror(errno));
  printHeading();
  for (int index = 0; index <= last; ++index) {
    semid_ds about = {};
    const int id = semctl(index, 0, SEM_STAT, SemaphoreArgument{.about = &about});
    const bool isOurs =
        id >= 0 && about.sem_nsems == kSemaphores && (about.sem_perm.mode & 0777U) == kMode;
    if (isOurs) printSet(id, about);  // unless it went away in between
  }
  return printed();
}

// Nothing, and the reason on standard error, without a set of one semaphore of this key.
static std::optional<int> findSet(key_t key, semid_ds *about) {
  const int id = semget(key, 0, 0);
  const bool isThere = id != -1 && semctl(id, 0, IPC_STAT, SemaphoreArgument{.about = about}) == 0;
  if (!isThere && errno == ENOENT) {
    failed(named(key), "there is no semaphore set");
  } else if (!isThere) {
    failed(named(key), strerror(errno));
  } else if (about->sem_nsems != kSemaphores) {
    failed(named(key), "a set of " + std::to_string(about->sem_nsems) +
                           " semaphores belongs to something else");
  } else {
    return id;
  }
  return std::nullopt;
}

static int listOne(key_t key) {
  semid_ds about = {};
  const std::optional<int> id = findSet(key, &about);
  if (!id) return kFailure;
  printHeading();
  return printSet(*id, about) ? printed() : failed(named(key), strerror(errno));
}

int listSemaphores(std::optional<key_t> key) {
  return key ? listOne(*key) : listOurs();
}

int removeSemaphore(key_t key) {
  semid_ds about = {};
  const std::optional<int> id = findSet(key, &about);
  if (!id) return kFailure;
  if (semctl(*id, 0, IPC_RMID) != 0) return failed(named(key), strerror(errno));
  printf("removed %s, id %d\n", named(key).c_str(), *id);
  return printed();
}
