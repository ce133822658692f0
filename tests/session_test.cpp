// The session's flags and helpers, called directly.
#include "installation.h"
#include "launcher/tav.h"

TEST(Session, FileExistAndDirExistsFollowLinks) {
  const Installation machine;
  const NZEMRUVTAV::TAVMaster session;
  const std::string base = machine.Directory() + "/kinds/";
  WriteFile(base + "file", "");
  fs::create_symlink("file", base + "link");
  fs::create_symlink("..", base + "directory");
  fs::create_symlink("nowhere", base + "dangling");
  for (const std::string& file : {base + "file", base + "link", std::string("/dev/null")}) {
    EXPECT_TRUE(session.FileExist(file) && !session.DirExists(file)) << file;
  }
  EXPECT_TRUE(session.DirExists(base + "directory") && !session.FileExist(base + "directory"));
  EXPECT_FALSE(session.DirExists(base + "dangling") || session.FileExist(base + "dangling"));
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
  ASSERT_NE(std::freopen("/dev/null", "r", stdin), nullptr);
  EXPECT_EQ(session.InvokeRUV("true", {}, true), 1) << "the answer is no";
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
