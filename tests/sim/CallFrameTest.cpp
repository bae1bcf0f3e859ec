// What every call shares: [Faults], the missing sysroot, serialisation across processes, and
// the library file's soname.
#include <dlfcn.h>
#include <unistd.h>

#include <algorithm>
#include <map>

#include "SimFixture.h"
#include "common/ChildProcess.h"

namespace kest::test::sim {
namespace {

TEST_F(SimTest, FaultsReturnTheirStatusAndDoNothingElse) {
    // Each call has a fault of its own: 0, a decimal or a hexadecimal status.
    std::string state = kState + "[Faults]\n";
    std::map<std::string, int32_t> faults;
    for (const CallRow& row : CallRows()) {
        const int32_t n = static_cast<int32_t>(faults.size());
        const int32_t status = n % 3 == 0 ? 0 : -375600 - n;
        if (faults.emplace(row.Name(), status).second) {
            std::ostringstream text;
            if (n % 3 == 2) {
                text << "-0x" << std::hex << std::uppercase << -status;
            } else {
                text << status;
            }
            state += row.Name() + " = " + text.str() + "\n";
        }
    }
    WriteState(state);
    for (const CallRow& row : CallRows()) {
        SCOPED_TRACE(row.logLine);
        Outputs outputs;
        EXPECT_EQ(row.call(outputs), faults[row.Name()]);
        EXPECT_EQ(outputs.Changed(), "");
        const std::string line = row.logLine;
        const size_t inputs = line.find('\t', line.find('\t') + 1);
        EXPECT_EQ(CallLog().back(), row.Name() + "\t" + std::to_string(faults[row.Name()]) +
                                        (inputs == std::string::npos ? "" : line.substr(inputs)));
    }
    EXPECT_EQ(State(), state);
}

TEST_F(SimTest, WithoutSysrootEveryCallFailsWithOneLineOnStandardError) {
    for (const char* value : {static_cast<const char*>(nullptr), "", "relative/root"}) {
        if (value == nullptr) {
            unsetenv("KEST_SYSROOT");
        } else {
            setenv("KEST_SYSROOT", value, 1);
        }
        for (const CallRow& row : CallRows()) {
            const kest::test::StreamCapture capture(2, sysroot_.PathOf("/stderr"));
            Outputs outputs;
            EXPECT_EQ(row.call(outputs), -375501) << row.logLine;
            EXPECT_EQ(outputs.Changed(), "");
            const std::string text = capture.Text();
            EXPECT_EQ(std::count(text.begin(), text.end(), '\n'), 1) << row.logLine << text;
            EXPECT_NE(text.find(row.Name()), std::string::npos) << text;
        }
    }
    EXPECT_FALSE(sysroot_.Exists("/var"));
}

TEST_F(SimTest, AFailedCallLogWriteIsReportedAndKeepsTheStatus) {
    sysroot_.MakeDirectory(kCallLogPath);
    WriteState(kState);
    const kest::test::StreamCapture capture(2, sysroot_.PathOf("/stderr"));
    Outputs outputs;
    EXPECT_EQ(tc::system::GetHostName(outputs.text), 0);
    EXPECT_EQ(outputs.Changed(), "text=kest-1");
    EXPECT_EQ(capture.Text(), "vqtargetcfg: GetHostName: open " + sysroot_.PathOf(kCallLogPath) +
                                  ": Is a directory\n");
}

TEST_F(SimTest, ConcurrentProcessesDoNotLoseUpdates) {
    // Each child writes one key of every device once; a lost update would lose a key for good.
    constexpr uint32_t kDevices = 30;
    std::string state;
    for (uint32_t i = 0; i < kDevices; ++i) {
        state += "[Device" + std::to_string(i) + "]\nMACAddress = m" + std::to_string(i) + "\n";
    }
    WriteState(state);
    kest::test::RunInChildren(2, [](int child) {
        for (uint32_t i = 0; i < kDevices; ++i) {
            EXPECT_EQ(child == 0 ? tc::network::SetEtherCATSettings(i, i, true)
                                 : tc::network::SetDeviceSettings(i, 0, 2, 100 + i),
                      0);
        }
    });
    for (uint32_t i = 0; i < kDevices; ++i) {
        uint32_t id = 0xFFFFFFFF;
        bool hasFlag = false;
        bool flag = false;
        ASSERT_EQ(tc::network::GetEtherCATSettings("m" + std::to_string(i), id, hasFlag, flag), 0);
        EXPECT_EQ(id, i);
        uint32_t interval = 0;
        ASSERT_EQ(tc::network::GetCurrentDeviceSettings(i, nullptr, nullptr, &interval), 0);
        EXPECT_EQ(interval, 100 + i);
    }
    EXPECT_EQ(CallLog().size(), 4 * kDevices);
}

// The test links the library by its soname, so the loaded file is the one the soname names.
TEST(SimLibrary, IsLoadedUnderItsSoname) {
    Dl_info info{};
    ASSERT_NE(dladdr(reinterpret_cast<void*>(&tc::system::GetHostName), &info), 0);
    const std::string path = info.dli_fname;
    const std::string suffix = "/libvqtargetcfg.so.1";
    ASSERT_GE(path.size(), suffix.size()) << path;
    EXPECT_EQ(path.substr(path.size() - suffix.size()), suffix);
}

}  // namespace
}  // namespace kest::test::sim
