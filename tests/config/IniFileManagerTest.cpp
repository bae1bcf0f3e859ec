#include <fcntl.h>
#include <sys/stat.h>

#include <string>

#include "IniTestSupport.h"
#include "config/IniFileManager.h"
#include "uxsys/StatusCodes.h"

namespace kest::test::config {

using kest::test::TempSysroot;

namespace {

// Gives the file the modification time `seconds` (Unix time), as an edit at that time would.
void SetModificationTime(const std::string& path, time_t seconds) {
    struct timespec times[2] = {{0, UTIME_OMIT}, {seconds, 0}};
    ASSERT_EQ(utimensat(AT_FDCWD, path.c_str(), times, 0), 0);
}

class IniFileManagerTest : public ::testing::Test {
  protected:
    std::string Read(const std::string& path, const char* section, const char* key) {
        std::string value = "<untouched>";
        HRESULT status = cache_->GetStringFromIni(path, section, key, value);
        return status == S_OK ? value : status == S_FALSE ? "<absent>" : "<failed>";
    }

    TempSysroot dir_;
    std::shared_ptr<IniFileManager> cache_ = IniFileManager::GetInstance();
};

TEST_F(IniFileManagerTest, OneInstanceWhileReferencedAndAFreshOneAfterwards) {
    std::string path = dir_.PathOf("/a.ini");
    WriteBytes(path, "[s]\nk=1\n");
    EXPECT_EQ(IniFileManager::GetInstance(), cache_);
    ASSERT_EQ(cache_->SetStringInIni(path, "s", "k", "unsaved"), S_OK);
    EXPECT_EQ(Read(path, "s", "k"), "unsaved");
    cache_.reset();
    cache_ = IniFileManager::GetInstance();
    EXPECT_EQ(Read(path, "s", "k"), "1");
}

TEST_F(IniFileManagerTest, MissingFileIsCachedEmptyUntilItAppears) {
    std::string path = dir_.PathOf("/late.ini");
    EXPECT_EQ(Read(path, "s", "k"), "<absent>");
    WriteBytes(path, "[s]\nk=\"quoted\"\nempty=\n");
    EXPECT_EQ(Read(path, "s", "k"), "quoted");
    EXPECT_EQ(Read(path, "S", "EMPTY"), "");
}

TEST_F(IniFileManagerTest, ReloadsWhenTheModificationTimeChangesOnly) {
    std::string path = dir_.PathOf("/change.ini");
    WriteBytes(path, "[s]\nk=1\n");
    SetModificationTime(path, 1000000000);
    EXPECT_EQ(Read(path, "s", "k"), "1");
    WriteBytes(path, "[s]\nk=2\n");
    SetModificationTime(path, 1000000000);
    EXPECT_EQ(Read(path, "s", "k"), "1");
    SetModificationTime(path, 1000000050);
    EXPECT_EQ(Read(path, "s", "k"), "2");
    WriteBytes(path, "[s]\nk=3\n");
    SetModificationTime(path, 1000000050);
    EXPECT_EQ(Read(path, "s", "k"), "2");
    // A rewrite within the same second is still a change.
    struct timespec times[2] = {{0, UTIME_OMIT}, {1000000050, 5000}};
    ASSERT_EQ(utimensat(AT_FDCWD, path.c_str(), times, 0), 0);
    EXPECT_EQ(Read(path, "s", "k"), "3");
    ASSERT_EQ(unlink(path.c_str()), 0);
    EXPECT_EQ(Read(path, "s", "k"), "3");
}

TEST_F(IniFileManagerTest, FlushSavesModifiedFilesOnlyAndOnce) {
    std::string existing = dir_.PathOf("/existing.ini");
    std::string created = dir_.PathOf("/created.ini");
    std::string untouched = dir_.PathOf("/untouched.ini");
    WriteBytes(existing, "[s]\nold=1\n");
    ASSERT_EQ(chmod(existing.c_str(), 0600), 0);
    WriteBytes(untouched, "[u]\nk=1\n");
    EXPECT_EQ(cache_->FlushIniCache(), S_FALSE);
    EXPECT_EQ(Read(untouched, "u", "k"), "1");

    ASSERT_EQ(cache_->SetStringInIni(existing, "s", "new", "a b"), S_OK);
    ASSERT_EQ(cache_->SetStringInIni(created, "t", "k", "v"), S_OK);
    EXPECT_EQ(cache_->SetStringInIni(created, "t", "k", "a\nb"), E_INVALIDARG);
    // A document with unsaved changes is not re-loaded when its file changes.
    WriteBytes(existing, "[s]\nold=theirs\n");
    SetModificationTime(existing, time(nullptr) + 100);
    WriteBytes(untouched, "changed outside");
    EXPECT_EQ(cache_->FlushIniCache(), S_OK);
    EXPECT_EQ(ReadBytes(existing), "[s]\nold = 1\nnew = \"a b\"\n\n");
    EXPECT_EQ(Read(existing, "s", "new"), "a b");
    EXPECT_EQ(ReadBytes(created), "[t]\nk = \"v\"\n\n");
    EXPECT_EQ(ReadBytes(untouched), "changed outside");
    EXPECT_FALSE(dir_.Exists("/existing.TMP"));
    struct stat status;
    ASSERT_EQ(stat(existing.c_str(), &status), 0);
    EXPECT_EQ(status.st_mode & 07777, 0600u);
    ASSERT_EQ(stat(created.c_str(), &status), 0);
    EXPECT_EQ(status.st_mode & 07777, 0664u);
    EXPECT_EQ(cache_->FlushIniCache(), S_FALSE);
}

TEST_F(IniFileManagerTest, FailedFlushKeepsTheChangeForTheNextTry) {
    std::string blocker = dir_.PathOf("/blocker");
    WriteBytes(blocker, "a regular file, not a directory");
    std::string path = blocker + "/settings.ini";
    ASSERT_EQ(cache_->SetStringInIni(path, "s", "k", "v"), S_OK);
    EXPECT_EQ(cache_->FlushIniCache(), E_FAIL);
    EXPECT_EQ(Read(path, "s", "k"), "v");
    ASSERT_EQ(unlink(blocker.c_str()), 0);
    ASSERT_EQ(mkdir(blocker.c_str(), 0755), 0);
    EXPECT_EQ(cache_->FlushIniCache(), S_OK);
    EXPECT_EQ(ReadBytes(path), "[s]\nk = \"v\"\n\n");
}

}  // namespace

}  // namespace kest::test::config
