#include "file/QlxRolling.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <fstream>
#include <map>
#include <memory>
#include <random>
#include <string>

#include <qlx/class/handler.h>

#include "QlxFileHandler.h"
#include "support/FailingMemory.h"
#include "support/SystemCalls.h"
#include "support/TempDir.h"
#include "support/WorkingDir.h"

namespace {

struct FreeVars {
  void operator()(QlxFileHandlerVars *vars) const { QlxFileHandlerFFreeVars(vars); }
};

// A file that is made by somebody else right after the library looked whether it is there.
class FileThatAppears {
 public:
  FileThatAppears(const std::string &name, const std::string &bytes) {
    calls_.afterLook = [=](const char *path) {
      const std::filesystem::path looked(path);
      if (looked.lexically_normal() != name || std::filesystem::exists(looked)) return;
      std::ofstream(name) << bytes;
    };
  }

 private:
  SystemCalls calls_;
};

class Generations : public ::testing::Test {
 protected:
  void SetUp() override { name("app.log"); }

  void name(const std::string &file) {
    qlxFHGetFileNameParts(dir.path(file).c_str(), vars.get());
    OslMemoryFree(vars->fullName);
    vars->fullName = qlxFHGenerationName(vars.get(), 0);
  }

  // The contents of app.log, app1.log, ... up to app4.log, "-" for a missing one.
  std::string contents() {
    std::string all;
    for (const char *name : {"app.log", "app1.log", "app2.log", "app3.log", "app4.log"}) {
      all += dir.has(name) ? dir.read(name) : "-";
    }
    return all;
  }

  // Something that can neither be removed, nor moved onto.
  void obstruct(const std::string &name) {
    std::filesystem::create_directories(dir.path(name + "/inside"));
  }

  static uint64_t told() {
    QlxHandlerProblems problems;
    qlxIntlGetHandlerProblems(&problems);
    return problems.rolloversFailed;
  }

  TempDir dir;
  std::unique_ptr<QlxFileHandlerVars, FreeVars> vars{
      static_cast<QlxFileHandlerVars *>(QlxFileHandlerFAllocVars())};
};

TEST_F(Generations, MoveUpByOneAndTheOldestGoes) {
  dir.write("app.log", "0");
  dir.write("app1.log", "1");
  dir.write("app2.log", "2");
  dir.write("app3.log", "3");
  vars->maxFiles = 3;
  qlxFileHandlerDoRollover(vars.get());
  EXPECT_EQ(contents(), "-013-");  // the fourth is not one of three
}

TEST_F(Generations, MoveUpAlsoWhenSomeAreMissing) {
  dir.write("app.log", "0");
  dir.write("app2.log", "2");
  vars->maxFiles = 4;
  qlxFileHandlerDoRollover(vars.get());
  EXPECT_EQ(contents(), "-0-2-");
}

TEST_F(Generations, LoseTheOldestAlsoWhenNoneTakesItsPlace) {
  dir.write("app.log", "0");
  dir.write("app2.log", "2");
  vars->maxFiles = 3;
  qlxFileHandlerDoRollover(vars.get());
  EXPECT_EQ(contents(), "-0---");
}

TEST_F(Generations, MoveWithoutTheActiveFileWhenItIsCopied) {
  dir.write("app.log", "0");
  dir.write("app1.log", "1");
  vars->maxFiles = 3;
  EXPECT_TRUE(qlxShiftGenerations(vars.get(), nullptr));
  EXPECT_EQ(contents(), "0-1--");
}

TEST_F(Generations, StayWhenThereIsOnlyOne) {
  dir.write("app.log", "0");
  dir.write("app1.log", "1");
  for (int32_t count : {1, 0, -1, INT32_MIN}) {
    vars->maxFiles = count;
    qlxFileHandlerDoRollover(vars.get());
    EXPECT_FALSE(qlxMoveActiveFile(vars.get()));
    EXPECT_FALSE(qlxShiftGenerations(vars.get(), nullptr));
    EXPECT_FALSE(qlxFreeFirstGeneration(vars.get(), nullptr));
    EXPECT_EQ(contents(), "01---");
  }
}

TEST_F(Generations, NeedNoMemoryWhenThereAreFew) {
  vars->maxFiles = 4;
  for (const char *name : {"app.log", "app1.log"}) dir.write(name, name[3] == '.' ? "0" : "1");
  FailingMemory memory;
  memory.failFrom(1);
  qlxFileHandlerDoRollover(vars.get());
  EXPECT_EQ(contents(), "-01--");
}

// ---- What cannot be moved

TEST_F(Generations, EndTheirMoveBelowOneThatStays) {
  for (const char *name : {"app.log", "app1.log"}) dir.write(name, name[3] == '.' ? "0" : "1");
  obstruct("app2.log");
  vars->maxFiles = 3;
  const uint64_t before = told();
  EXPECT_FALSE(qlxMoveActiveFile(vars.get()));
  EXPECT_EQ(dir.read("app.log") + dir.read("app1.log"), "01");
  EXPECT_EQ(told(), before + 2);  // neither removed nor moved onto
}

TEST_F(Generations, StayWhileTheOldestCannotBeRemovedHoweverOftenItIsTried) {
  vars->maxFiles = 5;
  dir.write("app.log", "0");
  for (const char *name : {"app1.log", "app2.log", "app3.log"}) {
    dir.write(name, std::string(1, name[3]));
  }
  obstruct("app4.log");
  for (int i = 0; i < 3; ++i) {
    EXPECT_FALSE(qlxMoveActiveFile(vars.get()));
    EXPECT_EQ(
        dir.read("app.log") + dir.read("app1.log") + dir.read("app2.log") + dir.read("app3.log"),
        "0123");
  }
  std::filesystem::remove_all(dir.path("app4.log"));
  EXPECT_TRUE(qlxMoveActiveFile(vars.get()));
  EXPECT_EQ(contents(), "-0123");
}

TEST_F(Generations, GoOnWhereAMoveFailed) {
  vars->maxFiles = 5;
  dir.write("app.log", "0");
  dir.write("app1.log", "1");
  dir.write("app2.log", "2");
  dir.write("app4.log", "4");
  vars->rollFailed = 1;  // 3 was moved, and the move of 2 failed
  EXPECT_TRUE(qlxMoveActiveFile(vars.get()));
  EXPECT_EQ(contents(), "-0124");
  EXPECT_EQ(vars->rollFailed, 0);
}

TEST_F(Generations, MoveTheActiveFileAloneOnceThatIsAllThatIsLeft) {
  vars->maxFiles = 4;
  dir.write("app.log", "0");
  dir.write("app2.log", "2");
  dir.write("app3.log", "3");
  vars->rollFailed = 1;
  EXPECT_TRUE(qlxMoveActiveFile(vars.get()));
  EXPECT_EQ(contents(), "-023-");
}

// What the look for a gap saw need not be true any more when the file is moved.
TEST_F(Generations, NeverReplaceAFileThatTookTheGapMeanwhile) {
  vars->maxFiles = 3;
  vars->rollFailed = 1;
  dir.write("app.log", "0");
  FileThatAppears appears{dir.path("app1.log"), "1"};
  EXPECT_FALSE(qlxMoveActiveFile(vars.get()));
  EXPECT_EQ(contents(), "01---");
}

// ---- Many generations

TEST_F(Generations, AreFoundByTheirDirectoryWhenThereMayBeMany) {
  for (const int32_t count : {101, 1000000, INT32_MAX}) {
    dir.write("app.log", "0");
    dir.write("app1.log", "1");
    dir.write("app3.log", "3");
    dir.write("app99.log", "99");
    vars->maxFiles = count;
    EXPECT_TRUE(qlxMoveActiveFile(vars.get())) << count;
    EXPECT_EQ(contents(), "-01-3") << count;
    EXPECT_EQ(dir.read("app100.log"), "99") << count;
    for (const char *name : {"app1.log", "app2.log", "app4.log", "app100.log"}) {
      std::filesystem::remove(dir.path(name));
    }
  }
}

TEST_F(Generations, LoseTheOldestOfMany) {
  dir.write("app.log", "0");
  dir.write("app199.log", "old");
  dir.write("app198.log", "next");
  vars->maxFiles = 200;
  EXPECT_TRUE(qlxMoveActiveFile(vars.get()));
  EXPECT_EQ(dir.read("app199.log"), "next");
  EXPECT_FALSE(dir.has("app198.log"));
  EXPECT_FALSE(dir.has("app200.log"));
}

TEST_F(Generations, AreNoFilesOfOtherNames) {
  vars->maxFiles = 1000;
  const std::vector<std::string> foreign = {
      "app01.log", "app1.lo",   "app1.logs", "app1log",  "app1.log.gz", "app-1.log",  "app+1.log",
      "app1x.log", "apps1.log", "1.log",     "app0.log", "app1000.log", "app1001.log"};
  for (const std::string &name : foreign) dir.write(name, name);
  dir.write("app.log", "0");
  EXPECT_TRUE(qlxMoveActiveFile(vars.get()));
  for (const std::string &name : foreign) EXPECT_EQ(dir.read(name), name);
  EXPECT_EQ(dir.read("app1.log"), "0");
}

TEST_F(Generations, WithoutAnExtensionAreFoundToo) {
  const WorkingDir here{dir.path()};
  qlxFHGetFileNameParts("app", vars.get());
  for (const char *name : {"app", "app1", "app7", "app1.log", "app2."}) dir.write(name, name);
  vars->maxFiles = 1000;
  EXPECT_TRUE(qlxMoveActiveFile(vars.get()));
  EXPECT_EQ(dir.list(), (std::vector<std::string>{"app1", "app1.log", "app2", "app2.", "app8"}));
}

TEST_F(Generations, BelowTheFirstGapMoveWhenTheDirectoryCannotBeListed) {
  vars->maxFiles = 1000;
  dir.write("app.log", "0");
  dir.write("app1.log", "1");
  dir.write("app3.log", "3");
  FailingMemory memory;
  memory.failOnce(1);
  EXPECT_TRUE(qlxMoveActiveFile(vars.get()));
  EXPECT_EQ(memory.failures(), 1u);
  EXPECT_EQ(contents(), "-013-");
}

TEST_F(Generations, InDirectoriesOfTheirOwnMoveToo) {  // the extension goes on behind a separator
  const WorkingDir here{dir.path()};
  qlxFHGetFileNameParts("logs.d/app", vars.get());
  vars->maxFiles = 1000;
  for (const char *name : {"logs.d", "logs1.d", "logs2.d"}) {
    std::filesystem::create_directory(dir.path(name));
  }
  dir.write("logs.d/app", "0");
  dir.write("logs1.d/app", "1");
  EXPECT_TRUE(qlxMoveActiveFile(vars.get()));
  EXPECT_EQ(dir.read("logs1.d/app") + dir.read("logs2.d/app"), "01");
}

// ---- Against a model: which file has which content

using Model = std::map<int32_t, std::string>;

class GenerationsModel : public Generations {
 protected:
  std::string file(int32_t generation) {
    return "app" + (generation ? std::to_string(generation) : "") + ".log";
  }
  void expectOnDisk(const Model &model, uint32_t seed) {
    std::vector<std::string> names;
    for (const auto &[generation, content] : model) {
      names.push_back(file(generation));
      EXPECT_EQ(dir.read(file(generation)), content) << "seed " << seed;
    }
    std::sort(names.begin(), names.end());
    EXPECT_EQ(dir.list(), names) << "seed " << seed;
  }
};

Model shifted(const Model &model, int32_t maxFiles) {
  Model after;
  for (const auto &[generation, content] : model) {
    if (generation < maxFiles - 1) after[generation + 1] = content;
    if (generation >= maxFiles) after[generation] = content;
  }
  return after;
}

TEST_F(GenerationsModel, MoveAsASimpleModelDoesWhateverIsThereAndHoweverManyThereMayBe) {
  for (uint32_t seed = 1; seed <= 300; ++seed) {
    std::mt19937 random(seed);
    Model model;
    const int32_t counts[] = {2, 3, 7, 100, 101, 102, 5000};
    vars->maxFiles = counts[random() % std::size(counts)];
    const uint32_t files = random() % 12;
    for (uint32_t i = 0; i < files; ++i) {
      model[static_cast<int32_t>(random() % static_cast<uint32_t>(vars->maxFiles + 2))] =
          std::to_string(random());
    }
    model[0] = "active";
    for (const auto &[generation, content] : model) dir.write(file(generation), content);
    for (int round = 0; round < 3; ++round) {
      EXPECT_TRUE(qlxMoveActiveFile(vars.get()));
      model = shifted(model, vars->maxFiles);
      expectOnDisk(model, seed);
      model[0] = dir.read("app1.log") + "+";
      dir.write("app.log", model[0]);
    }
    for (const auto &[generation, content] : model)
      std::filesystem::remove(dir.path(file(generation)));
    if (HasFailure()) return;
  }
}

}  // namespace
