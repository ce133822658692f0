// The session's flags and helpers, called directly.
#include <sys/stat.h>

#include <filesystem>

#include "installation.h"
#include "launcher/tav.h"

namespace fs = std::filesystem;

TEST(Session, FileExistAndDirExistFollowLinks) {
  const Installation machine;
  const NZEMRUVTAV::TAVMaster session;
  const std::string base = machine.Directory() + "/kinds/";
  WriteFile(base + "file", "");
  fs::create_symlink("file", base + "link");
  fs::create_symlink("..", base + "directory link");
  fs::create_symlink("nowhere", base + "dangling");
  ASSERT_EQ(mkfifo((base + "pipe").c_str(), 0600), 0);
  for (const std::string& file : {base + "file", base + "link", base + "pipe", std::string("/dev/null")}) {
    EXPECT_TRUE(session.FileExist(file) && !session.DirExists(file)) << file;
  }
  for (const std::string& directory : {base, base + "directory link"}) {
    EXPECT_TRUE(session.DirExists(directory) && !session.FileExist(directory)) << directory;
  }
  for (const std::string& neither :
       {base + "dangling", base + "file/below", std::string(), base + std::string(300, 'n')}) {
    EXPECT_FALSE(session.FileExist(neither) || session.DirExists(neither)) << neither;
  }
}

TEST(Session, StepsReturnTheirResults) {
  const Installation machine;
  NZEMRUVTAV::TAVMaster session;  // its directory is this program's, which has no data
  const std::string data = session.GetWorkingPath() + "/data";
  ASSERT_TRUE(fs::create_directory(data));
  EXPECT_EQ(session.TAVMasterGetSupportList(), -1);
  EXPECT_EQ(session.UpdateSupportList(), 1);
  EXPECT_EQ(session.TAVMasterGetSupportList(), 0);
  fs::remove_all(data);
  EXPECT_EQ(session.UpdateSupportList(), 0);
  EXPECT_EQ(session.InvokeRUV("true", {}, false), 1);
  EXPECT_EQ(session.InvokeRUV("false", {}, false), 1);
}

TEST(Session, RemembersPrebootOptions) {
  const Installation machine;
  NZEMRUVTAV::TAVMaster session;
  std::string words[] = {"launcher", "--gui", "--cmd"};
  char* gui[] = {words[0].data(), words[1].data()};
  char* cmd[] = {words[0].data(), words[2].data()};
  EXPECT_FALSE(session.isPrebootGUI() || session.isPrebootCmd());
  session.ParseParameters(2, gui);
  EXPECT_TRUE(session.isPrebootGUI() && !session.isPrebootCmd());
  session.ParseParameters(2, cmd);
  EXPECT_TRUE(session.isPrebootCmd());
}
