#include <sys/wait.h>
#include <unistd.h>

#include <gtest/gtest.h>

#include <cstdint>
#include <cstdio>
#include <cstring>
#include <fstream>
#include <set>
#include <string>
#include <vector>

#include "common/ChildProcess.h"
#include "support/Guid.h"
#include "support/HostInfo.h"

namespace kest::test::support {

using vq::dsc::Guid;
using vq::dsc::GuidToString;

namespace {

uint16_t ClockSequenceOf(const Guid& guid) {
    return static_cast<uint16_t>(((guid.Data4[0] & 0x3F) << 8) | guid.Data4[1]);
}

uint64_t TimestampOf(const Guid& guid) {
    return (uint64_t(guid.Data3 & 0x0FFF) << 48) | (uint64_t(guid.Data2) << 32) | guid.Data1;
}

TEST(Guid, SameBytesAsGuidAndTextFormWritesFieldsAsNumbers) {
    const GUID sample = {
        0x999d9aa4, 0x5475, 0x4ca7, {0xa5, 0x60, 0x93, 0xc5, 0x1b, 0x5b, 0xfc, 0xeb}};
    const Guid converted(sample);
    EXPECT_EQ(0, std::memcmp(&converted, &sample, sizeof(GUID)));
    EXPECT_TRUE(static_cast<GUID>(converted) == sample);
    EXPECT_EQ(L"{999D9AA4-5475-4CA7-A560-93C51B5BFCEB}", GuidToString(sample));
    EXPECT_EQ(L"{00000001-0002-0003-0004-000000000005}",
              GuidToString(GUID{1, 2, 3, {0, 4, 0, 0, 0, 0, 0, 5}}));
}

TEST(Guid, TimeBasedNeverRepeatAndCarryVersionVariantAndTheFirstAdapterAsNode) {
    std::vector<Guid> made(20000);
    for (Guid& guid : made) {
        guid = Guid::CreateTimeBased();
    }
    std::set<std::wstring> texts;
    for (size_t i = 0; i < made.size(); ++i) {
        ASSERT_EQ(0x1000, made[i].Data3 & 0xF000) << "version 1";
        ASSERT_EQ(0x80, made[i].Data4[0] & 0xC0) << "variant bits 10";
        ASSERT_TRUE(texts.insert(GuidToString(made[i])).second) << "repeated at " << i;
        ASSERT_TRUE(i == 0 || TimestampOf(made[i]) > TimestampOf(made[i - 1]));
        ASSERT_EQ(0, std::memcmp(made[i].Data4, made[0].Data4, 8)) << "sequence and node stay";
    }
    // 100-ns intervals from 1582-10-15 to 2020-01-01.
    EXPECT_GT(TimestampOf(made[0]), (12219292800ull + 1577836800ull) * 10000000ull);

    // The node is the first adapter's address, one of the machine's non-zero six-byte adapter
    // addresses as the kernel lists them; only a machine without any gets a random node.
    std::set<std::string> addresses;
    for (const std::string& adapter : EntriesOf("/sys/class/net")) {
        std::string address;
        std::ifstream("/sys/class/net/" + adapter + "/address") >> address;
        if (address.size() == 17 && address != "00:00:00:00:00:00") {
            addresses.insert(address);
        }
    }
    const std::string first = vq::dsc::osdep::FirstAdapterHardwareAddress();
    const uint8_t* node = &made[0].Data4[2];
    char text[18];
    std::snprintf(text, sizeof(text), "%02x:%02x:%02x:%02x:%02x:%02x", node[0], node[1], node[2],
                  node[3], node[4], node[5]);
    if (addresses.empty()) {
        EXPECT_EQ("00:00:00:00:00:00", first);
        EXPECT_EQ(0x80, node[0] & 0x80) << "a random node is marked";
    } else {
        EXPECT_EQ(1u, addresses.count(first)) << first;
        EXPECT_EQ(first, text);
    }
}

// Each process, forked ones included, draws its own random clock sequence: one sequence
// everywhere would let two processes, or a process after the clock went back, repeat
// identifiers. Three equal sequences of 14 random bits come up once in 2^28 runs.
TEST(Guid, ProcessesStartDifferentClockSequences) {
    std::set<uint16_t> sequences = {ClockSequenceOf(Guid::CreateTimeBased())};
    int channel[2];
    ASSERT_EQ(0, pipe(channel));
    for (int i = 0; i < 2; ++i) {
        if (fork() == 0) {
            const uint16_t sequence = ClockSequenceOf(Guid::CreateTimeBased());
            _exit(write(channel[1], &sequence, sizeof sequence) == sizeof sequence ? 0 : 1);
        }
    }
    close(channel[1]);
    for (uint16_t sequence = 0; read(channel[0], &sequence, sizeof sequence) == sizeof sequence;) {
        sequences.insert(sequence);
        wait(nullptr);
    }
    close(channel[0]);
    EXPECT_GT(sequences.size(), 1u);
}

}  // namespace

}  // namespace kest::test::support
