#include "foundation/clib_path.hpp"

#include <sys/time.h>
#include <unistd.h>

#include <cerrno>
#include <climits>
#include <cstdlib>
#include <cstring>
#include <ctime>
#include <filesystem>
#include <string>
#include <vector>

#include <gtest/gtest.h>

#include "foundation/exceptions.hpp"
#include "tests/foundation/failing_calls.hpp"
#include "tests/support/fatal.hpp"
#include "tests/support/temporary_directory.hpp"
#include "tests/support/thrown.hpp"

namespace {

constexpr const char* kNoSuchFile = "No such file or directory";
constexpr const char* kNowhere = "/nowhere/at/all";

// Comes back to the working directory it was made in.
struct WorkingDirectory {
    WorkingDirectory() = default;
    WorkingDirectory(const WorkingDirectory&) = delete;
    WorkingDirectory& operator=(const WorkingDirectory&) = delete;
    ~WorkingDirectory() { std::filesystem::current_path(previous); }

    std::filesystem::path previous = std::filesystem::current_path();
};

std::vector<std::string> environment() {
    std::vector<std::string> entries;
    for (char** entry = environ; *entry != nullptr; ++entry) {
        entries.emplace_back(*entry);
    }
    return entries;
}

TEST(ClibChdir, ChangesTheWorkingDirectory) {
    const WorkingDirectory guard;
    const TemporaryDirectory directory;
    EXPECT_EQ(Clib_chdir(directory.path().c_str()), 0);
    char path[PATH_MAX];
    EXPECT_EQ(Clib_getcwd(path, sizeof path), path);
    EXPECT_EQ(std::filesystem::path(path), std::filesystem::canonical(directory.path()));
}

TEST(ClibChdir, ThrowsClibChdirFailedExWithTheSystemsText) {
    EXPECT_EQ(messageOf<ClibChdirFailedEx>([] { Clib_chdir(kNowhere); }), kNoSuchFile);
}

TEST(ClibGetcwd, ThrowsClibPwdFailedExWithTheSystemsText) {
    char path[1];
    EXPECT_EQ(messageOf<ClibPwdFailedEx>([&] { Clib_getcwd(path, sizeof path); }),
              "Numerical result out of range");
}

TEST(ClibChmod, ChangesTheMode) {
    const TemporaryDirectory directory;
    const std::string path = directory.file("f", "");
    EXPECT_EQ(Clib_chmod(path.c_str(), 0640), 0);
    struct stat status {};
    EXPECT_EQ(Clib_stat(path.c_str(), &status), 0);
    EXPECT_EQ(status.st_mode & 07777, 0640U);
}

TEST(ClibChmod, ThrowsClibChmodFailedExWithTheSystemsText) {
    EXPECT_EQ(messageOf<ClibChmodFailedEx>([] { Clib_chmod(kNowhere, 0640); }), kNoSuchFile);
}

TEST(ClibMkdir, MakesADirectoryWithItsMode) {
    const TemporaryDirectory directory;
    const mode_t mask = Clib_umask(0);
    EXPECT_EQ(Clib_mkdir(directory.path("d").c_str(), 0777), 0);
    EXPECT_EQ(Clib_umask(mask), 0U);
    struct stat status {};
    Clib_stat(directory.path("d").c_str(), &status);
    EXPECT_EQ(status.st_mode, static_cast<mode_t>(S_IFDIR | 0777));
}

TEST(ClibMkdir, ThrowsExistsExForAnExistingDirectory) {
    const TemporaryDirectory directory;
    EXPECT_EQ(messageOf<ExistsEx>([&] { Clib_mkdir(directory.path().c_str(), 0777); }), "File exists");
}

TEST(ClibMkdir, ThrowsExistsExForAFileInItsPlace) {
    const TemporaryDirectory directory;
    const std::string path = directory.file("f", "");
    EXPECT_EQ(messageOf<ExistsEx>([&] { Clib_mkdir(path.c_str(), 0777); }), "File exists");
}

TEST(ClibMkdir, ThrowsClibMkdirFailedExForEveryOtherFailure) {
    EXPECT_EQ(messageOf<ClibMkdirFailedEx>([] { Clib_mkdir(kNowhere, 0777); }), kNoSuchFile);
}

TEST(ClibRmdir, RemovesADirectory) {
    const TemporaryDirectory directory;
    Clib_mkdir(directory.path("d").c_str(), 0777);
    EXPECT_EQ(Clib_rmdir(directory.path("d").c_str()), 0);
    EXPECT_FALSE(std::filesystem::exists(directory.path("d")));
}

TEST(ClibRmdir, ThrowsClibRmdirFailedExWithTheSystemsText) {
    const TemporaryDirectory directory;
    static_cast<void>(directory.file("f", ""));
    EXPECT_EQ(messageOf<ClibRmdirFailedEx>([&] { Clib_rmdir(directory.path().c_str()); }),
              "Directory not empty");
}

TEST(ClibUnlink, RemovesAFile) {
    const TemporaryDirectory directory;
    EXPECT_EQ(Clib_unlink(directory.file("f", "").c_str()), 0);
    EXPECT_FALSE(std::filesystem::exists(directory.path("f")));
}

TEST(ClibUnlink, ThrowsClibUnlinkFailedExWithTheSystemsText) {
    EXPECT_EQ(messageOf<ClibUnlinkFailedEx>([] { Clib_unlink(kNowhere); }), kNoSuchFile);
}

TEST(ClibStat, GivesTheStatus) {
    const TemporaryDirectory directory;
    struct stat status {};
    EXPECT_EQ(Clib_stat(directory.file("f", "text").c_str(), &status), 0);
    EXPECT_EQ(status.st_size, 4);
}

TEST(ClibStat, ThrowsClibStatFailedExWithTheSystemsText) {
    struct stat status {};
    EXPECT_EQ(messageOf<ClibStatFailedEx>([&] { Clib_stat(kNowhere, &status); }), kNoSuchFile);
}

TEST(ClibUtime, SetsBothTimesToNow) {
    const TemporaryDirectory directory;
    const std::string path = directory.file("f", "");
    const timeval longAgo[2] = {{1, 0}, {2, 0}};
    ASSERT_EQ(utimes(path.c_str(), longAgo), 0);
    const std::time_t before = std::time(nullptr) - 1; // the file system's clock is a coarse one
    EXPECT_EQ(Clib_utime(path.c_str()), 0);
    struct stat status {};
    Clib_stat(path.c_str(), &status);
    EXPECT_GE(status.st_atime, before);
    EXPECT_GE(status.st_mtime, before);
}

TEST(ClibUtime, ThrowsClibUtimeFailedExWithTheSystemsText) {
    EXPECT_EQ(messageOf<ClibUtimeFailedEx>([] { Clib_utime(kNowhere); }), kNoSuchFile);
}

TEST(ClibCheckProcess, FindsThisProcess) {
    EXPECT_EQ(Clib_checkProcess(Clib_getpid()), 0);
}

TEST(ClibCheckProcess, ThrowsClibGetProcStatusFailedExForAProcessThatDoesNotExist) {
    EXPECT_EQ(messageOf<ClibGetProcStatusFailedEx>([] { Clib_checkProcess(INT_MAX); }), kNoSuchFile);
    EXPECT_EQ(messageOf<ClibGetProcStatusFailedEx>([] { Clib_checkProcess(INT_MIN); }), kNoSuchFile);
}

TEST(ClibSetenv, LeavesTheVariableWithoutTheText) {
    const auto before = environment();
    EXPECT_EQ(Clib_setenv("MORVANE_TEST", "value"), 0);
    EXPECT_EQ(Clib_getenv("MORVANE_TEST"), nullptr);
    EXPECT_EQ(environment(), before); // every entry still leads to readable text
}

TEST(ClibSetenv, TakesAVariableAwayThatWasThere) {
    const auto before = environment();
    ASSERT_EQ(setenv("MORVANE_TEST", "old", 1), 0);
    EXPECT_EQ(Clib_setenv("MORVANE_TEST", "new"), 0);
    EXPECT_EQ(Clib_getenv("MORVANE_TEST"), nullptr);
    EXPECT_EQ(environment(), before);
}

TEST(ClibSetenv, LeavesAnEnvironmentThatTakesNewVariables) {
    for (int i = 0; i < 100; ++i) {
        Clib_setenv(("MORVANE_TEST" + std::to_string(i)).c_str(), "value");
    }
    ASSERT_EQ(setenv("MORVANE_TEST", "kept", 1), 0);
    EXPECT_STREQ(Clib_getenv("MORVANE_TEST"), "kept");
    ASSERT_EQ(unsetenv("MORVANE_TEST"), 0);
}

TEST(ClibSetenv, ThrowsClibPutenvFailedExWithTheSystemsText) {
    const auto before = environment();
    const ScopedFailures failures({.putenv = ENOMEM});
    EXPECT_EQ(messageOf<ClibPutenvFailedEx>([] { Clib_setenv("MORVANE_TEST", "value"); }),
              "Cannot allocate memory");
    EXPECT_EQ(environment(), before);
}

TEST(ClibMkstemp, MakesAFileAndItsName) {
    const TemporaryDirectory directory;
    std::string path = directory.path("fXXXXXX");
    const int fd = Clib_mkstemp(path.data());
    EXPECT_GE(fd, 0);
    EXPECT_TRUE(std::filesystem::exists(path));
    close(fd);
}

TEST(ClibMkstemp, GivesMinusOneWithoutThrowing) {
    char path[] = "no template";
    EXPECT_EQ(Clib_mkstemp(path), -1);
    EXPECT_EQ(errno, EINVAL);
}

TEST(ClibMkstemp, IsFatalWithoutATemplate) {
    EXPECT_FATAL(Clib_mkstemp(nullptr), "Assertion [ templateFile != __null ] failed\n");
}

TEST(ClibGetenv, GivesAVariableOrNull) {
    ASSERT_EQ(setenv("MORVANE_TEST", "value", 1), 0);
    EXPECT_STREQ(Clib_getenv("MORVANE_TEST"), "value");
    ASSERT_EQ(unsetenv("MORVANE_TEST"), 0);
    EXPECT_EQ(Clib_getenv("MORVANE_TEST"), nullptr);
}

TEST(ClibGetpid, GivesThisProcess) {
    EXPECT_EQ(Clib_getpid(), getpid());
}

} // namespace
