#include <dirent.h>
#include <signal.h>
#include <sys/inotify.h>
#include <sys/resource.h>
#include <sys/stat.h>
#include <sys/wait.h>
#include <unistd.h>

#include <cstring>
#include <functional>
#include <string>
#include <vector>

#include <gmock/gmock.h>

#include "IniTestSupport.h"
#include "common/ChildProcess.h"
#include "config/IniWriter.h"

namespace kest::test::config {

using kest::test::TempSysroot;

namespace {

const std::string kSample = "top=1\n[s]\nk=v\nq=\"a b\"\n[e]\n";

struct WriteCase {
    std::string document;  // loaded with keys before the first header allowed
    uint32_t flags;
    int maxLineLength;
    char splitCharacter;
    std::string saved;
};

// Layout by the write flags; long values split into numbered Line keys within the maximum, at
// the split character when given; a value without a clean cut on one longer line; a key named
// like a piece written as a run of one.
const WriteCase kWriteCases[] = {
    {kSample, 0, kIniNoMaxLineLength, 0, "top=1\n\n[s]\nk=v\nq=\"a b\"\n\n[e]\n\n"},
    {kSample, kIniWriteSpacedSeparator | kIniWriteByteOrderMark, kIniNoMaxLineLength, 0,
     "\xEF\xBB\xBFtop = 1\n\n[s]\nk = v\nq = \"a b\"\n\n[e]\n\n"},
    {"[s]\nk=" + std::string(40, 'x') + "\nlist=aaaa,bbbb,cccc,dddd,eeee,ffff\n", 0, 30, ',',
     "[s]\nk Line0001=xxxxxxxxxxxxxxxxx\nk Line0002=xxxxxxxxxxxxxxxxx\nk Line0003=xxxxxx\n"
     "list Line0001=aaaa,bbbb,\nlist Line0002=cccc,dddd,\nlist Line0003=eeee,ffff\n\n"},
    {"[s]\nk=a" + std::string(60, ' ') + "b\n", 0, 40, 0,
     "[s]\nk Line0001=a" + std::string(60, ' ') + "b\n\n"},
    {"[S]\nd Line0009 Line0001=literal\n", 0, 40, 0, "[S]\nd Line0009 Line0001=literal\n\n"},
};

TEST(IniWriteTest, DocumentsSaveAsTexts) {
    TempSysroot dir;
    for (const WriteCase& c : kWriteCases) {
        IniTextPtr ini =
            LoadFromBytes(dir, c.document, kIniDefaultReadFlags | kIniReadColonsAndUnnamedSection);
        EXPECT_EQ(SavedText(dir, ini.get(), c.flags, c.maxLineLength, c.splitCharacter), c.saved);
    }
    IniTextPtr ini = LoadFromBytes(dir, "[s]\ntenletters=" + std::string(30, 'x'));
    IniText_SetWriteOptions(ini.get(), 22, 0, 0);
    EXPECT_EQ(IniText_Save(ini.get(), dir.PathOf("/x.ini").c_str()), kIniNoRoomToSplit);
    EXPECT_EQ(IniText_SetWriteOptions(ini.get(), 80, 200, 0), kIniNotInt32);
}

// The setters' promise under the cache's read flags: every value and quote mark they accept
// reads back as given, whatever the line length; what they refuse (-22) would not have.
TEST(IniWriteTest, AcceptedValuesReadBackAndRefusedOnesWouldNot) {
    TempSysroot dir;
    constexpr uint32_t kCacheReadFlags = kIniReadKeepEmptyValues | kIniReadStripDoubleQuotes;
    const std::string values[] = {
        "",     "plain", "\"enclosed\"", "'apostrophes'", "\"",
        "\"\"", "''",    "a\"b",         "\"a",           "a\"",
        "'a",   "x=y;z", "\"a\" \"b\"",  "\" padded \"",  "\"" + std::string(50, 'l') + "\""};
    for (char quote : {'\0', '"', '\'', '`'}) {
        for (const std::string& value : values) {
            for (int maxLineLength : {kIniNoMaxLineLength, 30}) {
                IniTextPtr ini(IniText_Create());
                const int set = IniText_SetRaw(ini.get(), "S", "k", value.c_str(), quote);
                std::string saved;
                if (set == kIniFound) {
                    saved = SavedText(dir, ini.get(), kIniWriteSpacedSeparator, maxLineLength);
                } else {
                    EXPECT_EQ(set, kIniInvalidArgument);
                    // What the line would have been.
                    saved = "[S]\nk = " + (quote != 0 ? quote + value + quote : value) + "\n";
                }
                IniTextPtr loaded = LoadFromBytes(dir, saved, kCacheReadFlags);
                EXPECT_EQ(ValueOf(loaded.get(), "S", "k") == value, set == kIniFound)
                    << "quote " << int(quote) << ": " << saved;
            }
        }
    }
}

TEST(IniWriteTest, TemporaryNameReplacesOrAppendsTheExtension) {
    using kest::ini::TemporaryPathFor;
    EXPECT_EQ(TemporaryPathFor("/dir/name.ini"), "/dir/name.TMP");
    EXPECT_EQ(TemporaryPathFor("/dir/name"), "/dir/name.TMP");
    EXPECT_EQ(TemporaryPathFor("/dir/name.TMP"), "/dir/name.TMP.TMP");
    EXPECT_EQ(TemporaryPathFor("/d.x/name"), "/d.x/name.TMP");
    EXPECT_EQ(TemporaryPathFor("name.ini"), "name.ini.TMP");
}

// Names created in `directory` while `save` runs.
std::vector<std::string> NamesCreatedBy(const std::string& directory,
                                        const std::function<int()>& save) {
    int watch = inotify_init1(IN_NONBLOCK | IN_CLOEXEC);
    inotify_add_watch(watch, directory.c_str(), IN_CREATE);
    EXPECT_EQ(save(), 0);
    char buffer[4096];
    ssize_t length = read(watch, buffer, sizeof buffer);
    std::vector<std::string> names;
    for (ssize_t offset = 0; offset < length;) {
        // Copied out rather than cast: the buffer's records need not suit every alignment.
        inotify_event event;
        std::memcpy(&event, buffer + offset, sizeof event);
        names.emplace_back(buffer + offset + sizeof event);
        offset += static_cast<ssize_t>(sizeof event + event.len);
    }
    close(watch);
    return names;
}

TEST(IniWriteTest, SafeReplacementUsesTheTemporaryNameAndKeepsModeAndOwner) {
    TempSysroot dir;
    IniTextPtr ini = LoadFromBytes(dir, kSample, kIniReadColonsAndUnnamedSection);
    std::string target = dir.PathOf("/name.ini");
    WriteBytes(target, "old");
    ASSERT_EQ(chmod(target.c_str(), 0640), 0);
    bool ownerChanged = chown(target.c_str(), 4321, 8765) == 0;
    auto save = [&] { return IniText_Save(ini.get(), target.c_str()); };

    IniText_SetWriteOptions(ini.get(), kIniNoMaxLineLength, 0, kIniWriteSafeReplacement);
    EXPECT_THAT(NamesCreatedBy(dir.Root(), save),
                ::testing::Contains(::testing::MatchesRegex(R"(name\.TMP......)")));
    IniText_SetWriteOptions(ini.get(), kIniNoMaxLineLength, 0,
                            kIniWriteSafeReplacement | kIniWriteUniqueTemporary | kIniWriteSync);
    std::vector<std::string> names = NamesCreatedBy(dir.Root(), save);
    EXPECT_THAT(names, ::testing::Contains(::testing::MatchesRegex(R"(ini\$\$\.TMP......)")));
    for (const std::string& name : names) {
        EXPECT_FALSE(dir.Exists("/" + name)) << "left behind: " << name;
    }
    struct stat status;
    ASSERT_EQ(stat(target.c_str(), &status), 0);
    EXPECT_EQ(status.st_mode & 07777, 0640u);
    if (ownerChanged) {
        EXPECT_EQ(status.st_uid, 4321u);
        EXPECT_EQ(status.st_gid, 8765u);
    }
    EXPECT_EQ(ReadBytes(target).substr(0, 6), "top=1\n");
    // A new file made through the unique temporary gets mode 0644.
    target = dir.PathOf("/fresh.ini");
    ASSERT_EQ(save(), 0);
    ASSERT_EQ(stat(target.c_str(), &status), 0);
    EXPECT_EQ(status.st_mode & 07777, 0644u);
}

// Saves a document too large for a child's file-size limit; returns the child's save result.
int SaveUnderFileSizeLimit(const std::string& path, uint32_t flags) {
    const int status = kest::test::WaitForChild(kest::test::StartChild([&] {
        signal(SIGXFSZ, SIG_IGN);
        rlimit limit{4096, 4096};
        setrlimit(RLIMIT_FSIZE, &limit);
        IniTextPtr ini(IniText_Create());
        IniText_SetRaw(ini.get(), "s", "k", std::string(100000, 'x').c_str(), 0);
        IniText_SetWriteOptions(ini.get(), kIniNoMaxLineLength, 0, flags);
        _exit(-IniText_Save(ini.get(), path.c_str()));
    }));
    return status != -1 && WIFEXITED(status) ? -WEXITSTATUS(status) : 1;
}

TEST(IniWriteTest, FailedWriteNeverTruncatesTheTarget) {
    TempSysroot dir;
    std::string path = dir.PathOf("/target.ini");
    WriteBytes(path, "[keep]\nk=1\n");
    EXPECT_EQ(SaveUnderFileSizeLimit(path, kIniWriteSafeReplacement | kIniWriteSync),
              kIniWriteFailed);
    EXPECT_EQ(ReadBytes(path), "[keep]\nk=1\n");
    // The temporary is removed again.
    std::vector<std::string> names;
    DIR* listing = opendir(dir.Root().c_str());
    while (const dirent* entry = readdir(listing)) {
        if (entry->d_name[0] != '.') {
            names.emplace_back(entry->d_name);
        }
    }
    closedir(listing);
    EXPECT_EQ(names, std::vector<std::string>{"target.ini"});
    // Without safe replacement the half-written target is removed rather than left corrupt.
    EXPECT_EQ(SaveUnderFileSizeLimit(path, 0), kIniWriteFailed);
    EXPECT_FALSE(dir.Exists("/target.ini"));
}

TEST(IniWriteTest, UnwritableTargetsAndUnreadableNamesOrValuesAreRefused) {
    TempSysroot dir;
    dir.WriteFile("/plain", "x");
    std::string throughFile = dir.PathOf("/plain/sub.ini");
    IniTextPtr ini = LoadFromBytes(dir, "[s]\nk=v\n");
    IniText_SetWriteOptions(ini.get(), kIniNoMaxLineLength, 0, kIniWriteSafeReplacement);
    EXPECT_EQ(IniText_Save(ini.get(), throughFile.c_str()), kIniCannotWriteTarget);
    EXPECT_EQ(IniText_Save(ini.get(), dir.Root().c_str()), kIniCannotWriteTarget);
    EXPECT_EQ(IniText_Save(ini.get(), ""), kIniInvalidArgument);
    IniText_SetWriteOptions(ini.get(), kIniNoMaxLineLength, 0, 0);
    EXPECT_EQ(IniText_Save(ini.get(), throughFile.c_str()), kIniCannotOpenOutput);

    EXPECT_EQ(IniText_SetRaw(ini.get(), "", "k", "v", 0), kIniEmptyName);
    EXPECT_EQ(IniText_SetRaw(ini.get(), "s", " ", "v", 0), kIniEmptyName);
    for (const char* key : {"a=b", "[a", ";a", "a\rb"}) {
        EXPECT_EQ(IniText_SetRaw(ini.get(), "s", key, "v", 0), kIniInvalidArgument) << key;
    }
    EXPECT_EQ(IniText_SetRaw(ini.get(), "a]b", "k", "v", 0), kIniInvalidArgument);
    EXPECT_EQ(IniText_SetRaw(ini.get(), "s", "k", "v\n[injected]", 0), kIniInvalidArgument);
    EXPECT_EQ(IniText_SetString(ini.get(), "s", "k", "v\n[escaped]", true), kIniFound);
}

}  // namespace

}  // namespace kest::test::config
