// Null arguments of the platform layer: memory, strings, system services, files, text.
#include <sys/wait.h>

#include <fcntl.h>

#include <qlx/qlx.h>
#include <qlx/class.h>

#include "support/CaptureStdout.h"
#include "support/NullCalls.h"
#include "support/TempDir.h"

namespace {

// Checks that a block is what it was, "abc".
auto keeps(char *block) {
  return [=](char *result) {
    EXPECT_EQ(result, block);
    EXPECT_STREQ(block, "abc");
  };
}

auto empties(char *block) {
  return [=](char *result) {
    EXPECT_EQ(result, block);
    EXPECT_STREQ(block, "");
    OslStringCpy(block, "abc");
  };
}

NULL_GROUP(Memory) {
  NULLS(OslMemoryRealloc, with(nullptr, 8), [](void *block) {
    EXPECT_NE(block, nullptr);
    OslMemoryFree(block);
  });
  NULLS(OslMemoryFree, with(nullptr), nothing);
  NULLS(CxETOA, with(nullptr, 3), nothing);
}

NULL_GROUP(Strings) {
  NULLS(OslStringCmp, with("a", "a"), is(1), is(-1));
  NULLS(OslStringNCmp, with("a", "a", 0), is(1), is(-1));
  NULLS(OslStringICmp, with("a", "a"), is(1), is(-1));
  NULLS(OslStringNICmp, with("a", "a", 0), is(1), is(-1));
  char block[8] = "abc";
  NULLS(OslStringCat, with(block, "d"), isZero, keeps(block));
  NULLS(OslStringNCat, with(block, "d", 1), isZero, keeps(block));
  NULLS(OslStringCpy, with(block, "d"), isZero, empties(block));
  NULLS(OslStringNCpy, with(block, "d", 0), isZero, empties(block));
  NULLS(OslStringDup, with("a"), isZero);
  NULLS(OslStringLen, with("a"), isZero);
  NULLS(OslStringChr, with("a", 'a'), isZero);
  NULLS(OslStringRChr, with("a", 'a'), isZero);
  NULLS(OslStringStr, with("a", "a"), isZero);
  NULLS(OslStringStrpbrk, with("a", "a"), isZero);
  NULLS(OslStringStrcspn, with("abc", "c"), is(0xFFFFFFFF), is(3U));
  NULLS(OslStringStrspn, with("abc", "a"), is(0xFFFFFFFF), is(0U));
}

NULL_GROUP(Mutexes) {
  CxMutex mutex = nullptr;
  NULLS(CxMutexCreate, with(&mutex), fails(22));
  NULLS(CxMutexLock, with(&mutex), fails(22));
  NULLS(CxMutexUnlock, with(&mutex), fails(22));
  NULLS(CxMutexDestroy, with(&mutex), fails(22));
}

NULL_GROUP(Processes) {
  NULLS(CxProcessGetEnv, with("PATH"), isZero);
  char buffer[8] = "";
  NULLS(CxProcessGetCwd, with(buffer, 8), fails(22));
  int64_t id = 0;
  char *const arguments[] = {nullptr};
  NULLS(CxProcessCreate, with(&id, "/bin/true", static_cast<char *const *>(arguments)), fails(22),
        fails(22), [&](CxStatus status) {
          if (id == -1) _exit(1);  // the child of a start that failed
          EXPECT_EQ(status, kSuccess);
          int ended = -1;
          EXPECT_EQ(waitpid(static_cast<pid_t>(id), &ended, 0), id);
          EXPECT_EQ(ended, 0);
        });
}

void *returnArgument(void *argument) {
  return argument;
}

NULL_GROUP(Threads) {
  CxThread thread{};
  NULLS(CxThreadCreate, with(&thread, 0, returnArgument, &thread), fails(22), fails(22),
        [&](CxStatus status) {
          EXPECT_EQ(status, kSuccess);
          EXPECT_EQ(CxThreadJoin(&thread), kSuccess);
        });
  NULLS(CxThreadJoin, with(&thread), fails(22));
}

NULL_GROUP(System) {
  NULLS(CxSystemGetFQHostname, with(nullptr, 8), fails(22));
  ::testing::internal::CaptureStderr();
  NULLS(cxIntlTraceEnter, with("x"), nothing);
  NULLS(cxIntlTraceLeave, with("x"), nothing);
  NULLS(cxIntlTracePoint, with("x"), nothing);
  EXPECT_EQ(::testing::internal::GetCapturedStderr(), "");
}

NULL_GROUP(OpenFiles) {
  const TempDir dir;
  const std::string name = dir.path("file");
  CxFile file = -1;
  const auto failsToOpen = [&](CxStatus status) {
    EXPECT_EQ(status, failure(2));
    EXPECT_EQ(file, -1);
  };
  NULLS(CxFileOpen, with(&file, name.c_str(), O_CREAT | O_RDWR), fails(22), failsToOpen);
  NULLS(CxFileOpenMode, with(&file, name.c_str(), O_CREAT | O_RDWR, 0600), fails(22), failsToOpen);
  ASSERT_EQ(CxFileOpen(&file, name.c_str(), O_CREAT | O_RDWR), kSuccess);
  char buffer[4] = "";
  int32_t count = 7;
  int64_t size = 7;
  NULLS(CxFileRead, with(&file, buffer, 4, &count), fails(22));
  NULLS(CxFileWrite, with(&file, buffer, 4, &count), fails(22));
  NULLS(CxFileSeek, with(&file, 0, SEEK_SET), fails(22));
  NULLS(CxFileTrunc, with(&file), fails(22));
  NULLS(CxFileGetSize, with(&file, &size), fails(22));
  NULLS(CxFileFlush, with(&file), fails(22));
  NULLS(CxFileClose, with(&file), fails(22));
  EXPECT_EQ(CxFileClose(&file), kSuccess);
  EXPECT_EQ(count, 7);
  EXPECT_EQ(size, 7);
  EXPECT_EQ(dir.read("file"), "");
}

NULL_GROUP(FileNames) {
  const TempDir dir;
  const std::string name = dir.path("file");
  dir.write("file", "content");
  const std::string other = dir.path("other");
  int64_t size = 7;
  CxFileInfo info{};
  char buffer[4] = "abc";
  NULLS(CxFileNameGetSize, with(name.c_str(), &size), fails(22));
  NULLS(CxFileNameGetInfo, with(&info, name.c_str()), fails(22));
  NULLS(CxFileNameRemove, with(name.c_str()), fails(22));
  NULLS(CxFileNameRename, with(name.c_str(), other.c_str()), fails(22));
  NULLS(CxFileNameLocalize, with("x", buffer, 2), isZero);
  NULLS(CxFileNameGetNative, with("x", buffer, 2), isZero);
  EXPECT_EQ(size, 7);
  EXPECT_STREQ(buffer, "abc");
  EXPECT_EQ(dir.read("file"), "content");
}

NULL_GROUP(Paths) {
  CxFilePath path{};
  CxFilePath parent{};
  NULLS(CxInitFilePath, with(&path, "/a/b"), isZero, [&](uint8_t result) {
    EXPECT_EQ(result, 0);
    EXPECT_EQ(path.length, -1);
    EXPECT_EQ(path.lastSep, -1);
  });
  ASSERT_EQ(CxInitFilePath(&path, "/a/b"), 1);
  NULLS(CxFilePathIsDir, with(&path), is(22));
  NULLS(CxFilePathExists, with(&path), is(22));
  NULLS(CxFilePathParent, with(&path, &parent), isZero);
  NULLS(CxFilePathMkdirs, with(&path, 0700), is(22));
}

NULL_GROUP(Directories) {
  CxDirectory directory = nullptr;
  char name[8] = "abc";
  NULLS(CxDirectoryOpen, with(&directory, "/"), fails(22));
  ASSERT_EQ(CxDirectoryOpen(&directory, "/"), kSuccess);
  NULLS(CxDirectoryGetNext, with(&directory, name, 7), [&](CxStatus status) {
    EXPECT_EQ(status, failure(22));
    EXPECT_STREQ(name, "");
  });
  NULLS(CxDirectoryClose, with(&directory), fails(22));
  EXPECT_EQ(CxDirectoryClose(&directory), kSuccess);
}

NULL_GROUP(UnicodeStrings) {
  NULLS(CxUStringDupStrToUChar, with("a"), isZero);
  NULLS(CxUStringDupUCharToStr, with(u"a"), isZero);
  NULLS(CxUStringDup, with(u"a"), isZero);
  NULLS(CxUStringParmToStr, with(nullptr), isZero);
  CaptureStdout out;
  NULLS(CxUStringToStdout, with(u"a"), is(kSuccess));
  EXPECT_EQ(out.bytes(), "");
}

NULL_GROUP(StringBuffers) {
  CxStringBuff text{};
  ASSERT_EQ(CxStringBuffAppendStr(&text, "abc"), 1);
  NULLS(CxStringBuffAppendChar, with(&text, 'x'), isZero);
  NULLS(CxStringBuffAppendUTF32Char, with(&text, 'x'), isZero);
  NULLS(CxStringBuffAppendUCS2Char, with(&text, 'x'), isZero);
  NULLS(CxStringBuffAppendInt32, with(&text, 1), isZero);
  NULLS(CxStringBuffAppendInt64, with(&text, 1), isZero);
  NULLS(CxStringBuffAppendUInt64, with(&text, 1), isZero);
  NULLS(CxStringBuffAppendEBCDICInt64, with(&text, 1), isZero);
  NULLS(CxStringBuffAppendStr, with(&text, "x"), isZero);
  NULLS(CxStringBuffAppendStrN, with(&text, "x", 1), isZero);
  NULLS(CxStringBuffInsertStr, with(&text, "x", 0), isZero);
  NULLS(CxStringBuffTakeStr, with(&text), isZero);
  NULLS(CxStringBuffPeekStr, with(&text), isZero);
  NULLS(CxStringBuffCopyStr, with(&text), isZero);
  NULLS(CxStringBuffRestart, with(&text), nothing);
  NULLS(CxStringBuffDiscard, with(&text), nothing);
  NULLS(CxStringBuffPack, with(&text), isZero);
  EXPECT_EQ(take(CxStringBuffTakeStr(&text)), "abc");
}

NULL_GROUP(UnicodeStringBuffers) {
  CxUStringBuff text{};
  ASSERT_EQ(CxUStringBuffAppendStr(&text, "abc"), 1);
  NULLS(CxUStringBuffAppendChar, with(&text, 'x'), isZero);
  NULLS(CxUStringBuffAppendStr, with(&text, "x"), isZero);
  NULLS(CxUStringBuffAppendStrN, with(&text, "x", 1), isZero);
  NULLS(CxUStringBuffAppendUStr, with(&text, u"x"), isZero);
  NULLS(CxUStringBuffAppendInt32, with(&text, 1), isZero);
  NULLS(CxUStringBuffAppendInt64, with(&text, 1), isZero);
  NULLS(CxUStringBuffAppendUInt64, with(&text, 1), isZero);
  NULLS(CxUStringBuffAppendUDate, with(&text, 1.0), isZero);
  NULLS(CxUStringBuffAppendUDouble, with(&text, 1.0), isZero);
  NULLS(CxUStringBuffTakeUStr, with(&text), isZero);
  NULLS(CxUStringBuffRestart, with(&text), nothing);
  NULLS(CxUStringBuffDiscard, with(&text), nothing);
  EXPECT_EQ(take(CxUStringBuffTakeUStr(&text)), u"abc");
}

}  // namespace
