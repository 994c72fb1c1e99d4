// SPDX-License-Identifier: Apache-2.0
// Output files: written whole or not at all, through links, into pipes, never over an input.

#include "base/output_file.h"

#include <fcntl.h>
#include <gmock/gmock.h>
#include <sys/socket.h>
#include <sys/stat.h>
#include <sys/un.h>
#include <unistd.h>

#include <cstring>
#include <filesystem>
#include <fstream>
#include <iterator>

#include "base/error.h"
#include "base/file_descriptor.h"
#include "tests/support/temporary_folder.h"

namespace qz::base {
namespace {

namespace fs = std::filesystem;
using testing::HasSubstr;
using testing::ThrowsMessage;

class OutputFile : public testing::Test, protected test::TemporaryFolder {
 protected:
  std::string Contents(const std::string& name) const {
    std::ifstream file(Path(name), std::ios::binary);
    return {std::istreambuf_iterator<char>(file), {}};
  }
  mode_t ModeOf(const std::string& name) const {
    struct stat status = {};
    EXPECT_EQ(stat(Path(name).c_str(), &status), 0) << name;
    return status.st_mode & 07777;
  }
  std::ptrdiff_t FileCount() const { return std::distance(fs::directory_iterator(Path("")), {}); }
  void ExpectRefused(const std::string& path, const std::string& reason) const {
    const auto message =
        ThrowsMessage<OutputError>(HasSubstr(path + ": can't be written: " + reason));
    EXPECT_THAT([&] { WriteOutputFile(path, "new"); }, message);
    EXPECT_THAT([&] { CheckOutputFile(path); }, message);
  }
};

TEST_F(OutputFile, KeepsTheModeAndFollowsLinks) {
  const mode_t mask = umask(022);
  WriteOutputFile(Path("new"), "1");
  umask(mask);
  EXPECT_EQ(ModeOf("new"), 0644u);
  WriteBytes("private", "old");
  chmod(Path("private").c_str(), 0600);
  fs::create_symlink("private", Path("link"));
  fs::create_symlink(Path("link"), Path("link_of_link"));
  fs::create_symlink("not_yet", Path("dangling"));
  for (const char* name : {"private", "link_of_link", "dangling"}) CheckOutputFile(Path(name));
  EXPECT_EQ(Contents("private"), "old");
  EXPECT_EQ(FileCount(), 5) << "a check writes nothing";
  WriteOutputFile(Path("link_of_link"), "whole");
  WriteOutputFile(Path("dangling"), "made");
  EXPECT_TRUE(fs::is_symlink(Path("link")) && fs::is_symlink(Path("dangling")));
  EXPECT_EQ(Contents("private"), "whole");
  EXPECT_EQ(ModeOf("private"), 0600u);
  EXPECT_EQ(Contents("not_yet"), "made");
  EXPECT_EQ(FileCount(), 6);
}

TEST_F(OutputFile, GoesThroughDevicesAndPipes) {
  WriteOutputFile("/dev/null", "bytes");
  ExpectRefused(Path("absent/x"), "No such file");
  EXPECT_THAT([] { WriteOutputFile("/dev/full", "bytes"); },
              ThrowsMessage<OutputError>(HasSubstr("/dev/full: can't be written: No space")));
  ASSERT_EQ(mkfifo(Path("pipe").c_str(), 0600), 0);
  const FileDescriptor reader(open(Path("pipe").c_str(), O_RDONLY | O_NONBLOCK));
  CheckOutputFile(Path("pipe"));
  WriteOutputFile(Path("pipe"), "through");
  char got[16] = {};
  EXPECT_EQ(read(reader.get(), got, sizeof(got)), 7);
  EXPECT_STREQ(got, "through");
  // A redirected stream keeps its file.
  const FileDescriptor redirected(open(Path("log").c_str(), O_RDWR | O_CREAT, 0600));
  WriteOutputFile("/dev/fd/" + std::to_string(redirected.get()), "logged");
  EXPECT_EQ(read(redirected.get(), got, sizeof(got)), 6);
}

TEST_F(OutputFile, IsRefusedWhereItCannotBeOne) {
  ExpectRefused(Path(""), "it is a folder, should be a file");
  ExpectRefused(WriteBytes("file", "old") + "/x", "Not a directory");
  fs::create_symlink(Path("loop"), Path("loop"));
  ExpectRefused(Path("loop"), std::strerror(ELOOP));
  const FileDescriptor socket_file(socket(AF_UNIX, SOCK_STREAM, 0));
  sockaddr_un address = {AF_UNIX, {}};
  Path("socket").copy(address.sun_path, sizeof(address.sun_path) - 1);
  ASSERT_EQ(bind(socket_file.get(), reinterpret_cast<sockaddr*>(&address), sizeof(address)), 0);
  ExpectRefused(Path("socket"), "it is neither a regular file, a pipe nor a character device");
  EXPECT_THAT(
      [&] { MakeOutputFolder(Path("file/inner")); },
      ThrowsMessage<OutputError>(HasSubstr("file/inner: this folder can't be made: Not a")));
  EXPECT_EQ(Contents("file"), "old");
}

TEST_F(OutputFile, IsNoInput) {
  const std::string input = WriteBytes("input", "data");
  fs::create_hard_link(input, Path("hard"));
  fs::create_symlink("input", Path("soft"));
  for (const char* name : {"input", "hard", "soft", "../", "absent"}) {
    const std::string output = Path(name);
    const bool same = std::strlen(name) < 6 && name[0] != '.';
    EXPECT_EQ(IsSameFile(output, input), same) << name;
    if (!same) continue;
    EXPECT_THAT(
        [&] {
          CheckOutputFile(output, {"", Path("other"), input});
        },
        ThrowsMessage<OutputError>(HasSubstr("it is the input " + input + " too")));
  }
  EXPECT_TRUE(IsSameFile(Path("absent"), Path("./absent"))) << "neither exists";
  CheckOutputFile(Path("new"), {Path("new"), input});
}

}  // namespace
}  // namespace qz::base
