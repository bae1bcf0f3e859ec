#include <fcntl.h>
#include <signal.h>
#include <sys/inotify.h>
#include <sys/resource.h>
#include <sys/stat.h>
#include <sys/wait.h>
#include <unistd.h>

#include <algorithm>
#include <climits>
#include <sstream>
#include <string>
#include <vector>

#include "IniTestSupport.h"
#include "config/IniWriter.h"

using kest::test::TempSysroot;

namespace {

// The names created in a directory while the object lives.
class CreatedNames {
  public:
    explicit CreatedNames(const std::string& directory)
        : inotify_(inotify_init1(IN_NONBLOCK | IN_CLOEXEC)) {
        inotify_add_watch(inotify_, directory.c_str(), IN_CREATE);
    }
    ~CreatedNames() { close(inotify_); }

    std::vector<std::string> Names() const {
        std::vector<std::string> names;
        alignas(inotify_event) char buffer[8192];
        ssize_t length = read(inotify_, buffer, sizeof buffer);
        for (ssize_t offset = 0; offset < length;) {
            const auto* event = reinterpret_cast<const inotify_event*>(buffer + offset);
            names.emplace_back(event->name);
            offset += static_cast<ssize_t>(sizeof(inotify_event) + event->len);
        }
        return names;
    }

  private:
    int inotify_;
};

IniTextPtr SampleDocument() {
    IniTextPtr ini = NewIniText();
    IniText_SetRaw(ini.get(), "s", "k", "v", 0);
    IniText_SetString(ini.get(), "s", "q", "a b", false);
    IniText_SetRaw(ini.get(), nullptr, "top", "1", 0);
    IniText_SetRaw(ini.get(), "e", "gone", "x", 0);
    IniText_DeleteKey(ini.get(), "e", "gone");
    return ini;
}

struct LayoutCase {
    uint32_t flags;
    std::string text;
};

class IniLayoutTest : public ::testing::TestWithParam<LayoutCase> {};

TEST_P(IniLayoutTest, WritesSectionsKeysAndSeparators) {
    TempSysroot dir;
    IniTextPtr ini = SampleDocument();
    IniText_SetWriteOptions(ini.get(), kIniNoMaxLineLength, 0, GetParam().flags);
    std::string path = dir.PathOf("/layout.ini");
    ASSERT_EQ(IniText_Save(ini.get(), path.c_str()), 0);
    EXPECT_EQ(ReadBytes(path), GetParam().text);
}

INSTANTIATE_TEST_SUITE_P(
    Flags, IniLayoutTest,
    ::testing::Values(LayoutCase{0, "top=1\n\n[s]\nk=v\nq=\"a b\"\n\n[e]\n\n"},
                      LayoutCase{kIniWriteSpacedSeparator,
                                 "top = 1\n\n[s]\nk = v\nq = \"a b\"\n\n[e]\n\n"},
                      LayoutCase{kIniWriteByteOrderMark | kIniWriteSafeReplacement | kIniWriteSync,
                                 "\xEF\xBB\xBFtop=1\n\n[s]\nk=v\nq=\"a b\"\n\n[e]\n\n"}));

TEST(IniSplitTest, LongValuesBecomeNumberedLinesOfTheMaximumLength) {
    TempSysroot dir;
    std::string path = dir.PathOf("/split.ini");
    IniTextPtr ini = NewIniText();
    IniText_SetRaw(ini.get(), "s", "k", std::string(40, 'x').c_str(), 0);
    IniText_SetRaw(ini.get(), "s", "list", "aaaa,bbbb,cccc,dddd,eeee,ffff", 0);
    IniText_SetWriteOptions(ini.get(), 30, ',', 0);
    ASSERT_EQ(IniText_Save(ini.get(), path.c_str()), 0);
    EXPECT_EQ(ReadBytes(path),
              "[s]\n"
              "k Line0001=xxxxxxxxxxxxxxxxx\nk Line0002=xxxxxxxxxxxxxxxxx\nk Line0003=xxxxxx\n"
              "list Line0001=aaaa,bbbb,\nlist Line0002=cccc,dddd,\nlist Line0003=eeee,ffff\n\n");
}

TEST(IniSplitTest, SplitValuesReadBackAsTheKeyTheyWere) {
    const std::vector<std::string> values = {
        std::string(100, 'a'),
        "lorem ipsum dolor sit amet consectetur adipiscing elit sed do eiusmod tempor incididunt "
        "ut labore et dolore magna aliqua",
        "alpha          bravo          charlie          delta          echo          foxtrot",
        "x\"y\"z 'p' \"q\" r \"s\" t 'u' v \"w\" x 'y' z \"0\" 1 '2' 3 \"4\" 5 '6' 7 \"8\" 9 '0'"};
    TempSysroot dir;
    std::string path = dir.PathOf("/split.ini");
    for (char quote : {'\0', '"'}) {
        for (char split : {'\0', ' '}) {
            IniTextPtr ini = NewIniText();
            for (size_t i = 0; i < values.size(); ++i) {
                std::string key = "key" + std::to_string(i);
                IniText_SetRaw(ini.get(), "s", key.c_str(), values[i].c_str(), quote);
            }
            IniText_SetWriteOptions(ini.get(), 40, split, 0);
            ASSERT_EQ(IniText_Save(ini.get(), path.c_str()), 0);
            std::istringstream lines(ReadBytes(path));
            for (std::string line; std::getline(lines, line);) {
                EXPECT_LE(line.size(), 40u) << line;
            }
            IniTextPtr loaded = NewIniText();
            ASSERT_EQ(IniText_Load(loaded.get(), path.c_str()), 0);
            ASSERT_EQ(IniText_GetKeyCount(loaded.get(), "s"), static_cast<int>(values.size()));
            for (size_t i = 0; i < values.size(); ++i) {
                std::string key = "key" + std::to_string(i);
                EXPECT_EQ(ValueOf(loaded.get(), "s", key.c_str()), values[i])
                    << "quote " << int(quote) << " split " << int(split);
            }
        }
    }
}

TEST(IniSplitTest, ValueWithoutACleanCutStaysOnOneLongerLine) {
    TempSysroot dir;
    std::string path = dir.PathOf("/split.ini");
    std::string value = "a" + std::string(60, ' ') + "b";
    IniTextPtr ini = NewIniText();
    IniText_SetRaw(ini.get(), "s", "k", value.c_str(), 0);
    IniText_SetWriteOptions(ini.get(), 40, 0, 0);
    ASSERT_EQ(IniText_Save(ini.get(), path.c_str()), 0);
    EXPECT_EQ(ReadBytes(path), "[s]\nk Line0001=" + value + "\n\n");
    IniTextPtr loaded = NewIniText();
    ASSERT_EQ(IniText_Load(loaded.get(), path.c_str()), 0);
    EXPECT_EQ(ValueOf(loaded.get(), "s", "k"), value);
}

TEST(IniSplitTest, NoRoomForAPieceFailsWithoutTouchingTheFile) {
    TempSysroot dir;
    std::string path = dir.PathOf("/split.ini");
    WriteBytes(path, "old");
    IniTextPtr ini = NewIniText();
    IniText_SetRaw(ini.get(), "s", "tenletters", std::string(30, 'x').c_str(), 0);
    IniText_SetWriteOptions(ini.get(), 22, 0, 0);
    EXPECT_EQ(IniText_Save(ini.get(), path.c_str()), kIniNoRoomToSplit);
    EXPECT_EQ(ReadBytes(path), "old");
    EXPECT_EQ(IniText_SetWriteOptions(ini.get(), 80, 200, 0), kIniNotInt32);
}

struct TemporaryCase {
    std::string target;
    std::string temporary;
};

class IniTemporaryPathTest : public ::testing::TestWithParam<TemporaryCase> {};

TEST_P(IniTemporaryPathTest, ReplacesOrAppendsTheExtension) {
    EXPECT_EQ(kest_ini::TemporaryPathFor(GetParam().target), GetParam().temporary);
}

INSTANTIATE_TEST_SUITE_P(Names, IniTemporaryPathTest,
                         ::testing::Values(TemporaryCase{"/dir/name.ini", "/dir/name.TMP"},
                                           TemporaryCase{"/dir/name", "/dir/name.TMP"},
                                           TemporaryCase{"/dir/name.", "/dir/name.TMP"},
                                           TemporaryCase{"/dir/name.TMP", "/dir/name.TMP.TMP"},
                                           TemporaryCase{"/d.x/name", "/d.x/name.TMP"},
                                           TemporaryCase{"name.ini", "name.ini.TMP"}));

TEST(IniSaveTest, SafeReplacementGoesThroughTheTemporaryName) {
    TempSysroot dir;
    std::string path = dir.PathOf("/name.ini");
    IniTextPtr ini = SampleDocument();
    IniText_SetWriteOptions(ini.get(), kIniNoMaxLineLength, 0, kIniWriteSafeReplacement);
    {
        CreatedNames created(dir.Root());
        ASSERT_EQ(IniText_Save(ini.get(), path.c_str()), 0);
        std::vector<std::string> names = created.Names();
        EXPECT_NE(std::find(names.begin(), names.end(), "name.TMP"), names.end());
    }
    {
        CreatedNames created(dir.Root());
        IniText_SetWriteOptions(ini.get(), kIniNoMaxLineLength, 0,
                                kIniWriteSafeReplacement | kIniWriteUniqueTemporary);
        std::string fresh = dir.PathOf("/fresh.ini");
        ASSERT_EQ(IniText_Save(ini.get(), fresh.c_str()), 0);
        std::vector<std::string> names = created.Names();
        EXPECT_TRUE(std::any_of(names.begin(), names.end(), [](const std::string& name) {
            return name.size() == 15 && name.compare(0, 9, "ini$$.TMP") == 0;
        })) << ::testing::PrintToString(names);
        struct stat status;
        ASSERT_EQ(stat(fresh.c_str(), &status), 0);
        EXPECT_EQ(status.st_mode & 07777, 0644u);
    }
    EXPECT_EQ(ReadBytes(path), ReadBytes(dir.PathOf("/fresh.ini")));
    EXPECT_FALSE(dir.Exists("/name.TMP"));
}

TEST(IniSaveTest, ReplacedFileKeepsModeAndOwner) {
    TempSysroot dir;
    std::string path = dir.PathOf("/owned.ini");
    WriteBytes(path, "[old]\n");
    ASSERT_EQ(chmod(path.c_str(), 0640), 0);
    bool ownerChanged = chown(path.c_str(), 4321, 8765) == 0;
    IniTextPtr ini = SampleDocument();
    for (uint32_t flags : {kIniWriteSafeReplacement,
                           kIniWriteSafeReplacement | kIniWriteUniqueTemporary | kIniWriteSync}) {
        IniText_SetWriteOptions(ini.get(), kIniNoMaxLineLength, 0, flags);
        ASSERT_EQ(IniText_Save(ini.get(), path.c_str()), 0);
        struct stat status;
        ASSERT_EQ(stat(path.c_str(), &status), 0);
        EXPECT_EQ(status.st_mode & 07777, 0640u);
        if (ownerChanged) {
            EXPECT_EQ(status.st_uid, 4321u);
            EXPECT_EQ(status.st_gid, 8765u);
        }
        EXPECT_EQ(ReadBytes(path).compare(0, 6, "top=1\n"), 0);
    }
}

// Saves a document too large for the file-size limit of a child process; returns the save
// result the child saw.
int SaveUnderFileSizeLimit(const std::string& path, uint32_t flags) {
    pid_t child = fork();
    if (child == 0) {
        signal(SIGXFSZ, SIG_IGN);
        rlimit limit{4096, 4096};
        setrlimit(RLIMIT_FSIZE, &limit);
        IniTextPtr ini = NewIniText();
        IniText_SetRaw(ini.get(), "s", "k", std::string(100000, 'x').c_str(), 0);
        IniText_SetWriteOptions(ini.get(), kIniNoMaxLineLength, 0, flags);
        _exit(-IniText_Save(ini.get(), path.c_str()));
    }
    int status = 0;
    waitpid(child, &status, 0);
    return WIFEXITED(status) ? -WEXITSTATUS(status) : INT_MIN;
}

TEST(IniSaveTest, FailedWriteNeverTruncatesTheTarget) {
    TempSysroot dir;
    std::string path = dir.PathOf("/target.ini");
    WriteBytes(path, "[keep]\nk=1\n");
    for (uint32_t flags : {kIniWriteSafeReplacement, kIniWriteSafeReplacement | kIniWriteSync}) {
        EXPECT_EQ(SaveUnderFileSizeLimit(path, flags), kIniWriteFailed);
        EXPECT_EQ(ReadBytes(path), "[keep]\nk=1\n");
        EXPECT_FALSE(dir.Exists("/target.TMP"));
    }
    // Without safe replacement the half-written target is removed rather than left corrupt.
    EXPECT_EQ(SaveUnderFileSizeLimit(path, 0), kIniWriteFailed);
    EXPECT_FALSE(dir.Exists("/target.ini"));
}

TEST(IniSaveTest, UnwritableTargetsAreReported) {
    TempSysroot dir;
    std::string file = dir.PathOf("/plain");
    WriteBytes(file, "x");
    std::string throughFile = file + "/sub.ini";
    IniTextPtr ini = SampleDocument();
    IniText_SetWriteOptions(ini.get(), kIniNoMaxLineLength, 0, kIniWriteSafeReplacement);
    EXPECT_EQ(IniText_Save(ini.get(), throughFile.c_str()), kIniCannotWriteTarget);
    EXPECT_EQ(IniText_Save(ini.get(), dir.Root().c_str()), kIniCannotWriteTarget);
    EXPECT_EQ(IniText_Save(ini.get(), ""), kIniInvalidArgument);
    IniText_SetWriteOptions(ini.get(), kIniNoMaxLineLength, 0, 0);
    EXPECT_EQ(IniText_Save(ini.get(), throughFile.c_str()), kIniCannotOpenOutput);
    EXPECT_EQ(IniText_HasFileChanged(ini.get()), kIniInvalidArgument);
}

TEST(IniSaveTest, ChangeDetectionFollowsTheSavedFile) {
    TempSysroot dir;
    std::string path = dir.PathOf("/watched.ini");
    IniTextPtr ini = SampleDocument();
    ASSERT_EQ(IniText_Save(ini.get(), path.c_str()), 0);
    EXPECT_EQ(IniText_HasFileChanged(ini.get()), 0);
    struct timespec times[2] = {{0, UTIME_OMIT}, {1000000000, 0}};
    ASSERT_EQ(utimensat(AT_FDCWD, path.c_str(), times, 0), 0);
    EXPECT_EQ(IniText_HasFileChanged(ini.get()), 1);
    ASSERT_EQ(unlink(path.c_str()), 0);
    EXPECT_LT(IniText_HasFileChanged(ini.get()), 0);
}

TEST(IniSetTest, NamesAndValuesThatWouldNotReadBackAreRefused) {
    IniTextPtr ini = NewIniText();
    EXPECT_EQ(IniText_SetRaw(ini.get(), "", "k", "v", 0), kIniEmptyName);
    EXPECT_EQ(IniText_SetRaw(ini.get(), "s", " ", "v", 0), kIniEmptyName);
    EXPECT_EQ(IniText_SetRaw(ini.get(), "s", nullptr, "v", 0), kIniEmptyName);
    for (const char* section : {"a]b", "a\nb"}) {
        EXPECT_EQ(IniText_SetRaw(ini.get(), section, "k", "v", 0), kIniInvalidArgument);
    }
    for (const char* key : {"a=b", "[a", ";a", "a\rb"}) {
        EXPECT_EQ(IniText_SetRaw(ini.get(), "s", key, "v", 0), kIniInvalidArgument);
    }
    EXPECT_EQ(IniText_SetRaw(ini.get(), "s", "k", "v\n[injected]", 0), kIniInvalidArgument);
    EXPECT_EQ(IniText_SetRaw(ini.get(), "s", "k", "v", '['), kIniInvalidArgument);
    EXPECT_EQ(IniText_GetSectionCount(ini.get()), 0);
    EXPECT_EQ(IniText_SetString(ini.get(), "s", "k", "v\n[injected]", true), kIniFound);
}

}  // namespace
