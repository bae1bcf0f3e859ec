#include "PluginHost.h"

#include <fstream>
#include <sstream>
#include <stdexcept>
#include <string>

#include "hostkit/DemoController.h"

namespace kest::bench {
namespace {

constexpr char kControllerState[] =
    "[System]\nDeviceDescription = KEST 9100\nTargetClass = KEST\nHostName = kest-1\n"
    "TargetID = 7\nSerialNumber = 0x00123456\nUserComment = bench controller\n"
    "LanguageName = English\nSupportedLanguages = English,German\nTimeZone = Europe/Berlin\n"
    "TimezoneOffset = 3600\nFullyQualifiedDNSName = kest-1.bench\n"
    "[Network]\nPrimaryDeviceIndex = 0\n"
    "[Device0]\nType = 1\nInterfaceName = eth0\nIndex = 0\nMACAddress = 00:80:2F:12:34:56\n"
    "Mode = 2\nSupportedModes = 3\nRequestMode = 1\nSupportedRequestModes = 3\n"
    "IPAddress = 192.168.1.10\nSubnetMask = 255.255.255.0\nGateway = 192.168.1.1\n"
    "DNSServer = 192.168.1.2\nSupportedMediaModes = 0x1F\nCurrentMediaMode = 4\n"
    "PreferredMediaMode = 4\nSupportedPollingModes = 3\nPollingMode = 1\nPollingInterval = 100\n"
    "InterfaceUp = 1\nAdapterUp = 1\n";

std::string FileContent(const std::string& path) {
    std::ifstream file(path, std::ios::binary);
    std::ostringstream content;
    content << file.rdbuf();
    if (!file) {
        throw std::runtime_error("cannot read " + path);
    }
    return content.str();
}

}  // namespace

void WriteControllerSysroot(const kest::test::TempSysroot& sysroot) {
    kest::hostkit::WriteControllerState(sysroot.Root(), kControllerState);
    sysroot.WriteFile("/etc/korvane/version", "22.5.0\n");
    sysroot.WriteFile("/usr/share/vqsysapi/timezone.ini", FileContent(KEST_TIMEZONE_TABLE_PATH));
    for (const char* zone : {"Europe/Berlin", "America/Chicago", "America/Los_Angeles"}) {
        sysroot.WriteFile(std::string("/usr/share/zoneinfo/") + zone, "TZif");
    }
    sysroot.MakeDirectory("/etc/korvane/share");
}

LoadedExpert::LoadedExpert() : expert_(plugin_.CreateExpert()) {
    if (expert_->Initialize() != S_OK) {
        throw std::runtime_error("the expert's Initialize failed");
    }
}

LoadedExpert::~LoadedExpert() {
    expert_->Uninitialize();
}

}  // namespace kest::bench
