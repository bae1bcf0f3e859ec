#include "system/KestConfigIni.h"

#include <cstdint>
#include <string>

#include "support/Sysroot.h"
#include "uxsys/StatusCodes.h"

namespace nVQKESTSYSAPICHASSISEXPERT100 {
namespace {

constexpr char kWebServiceSection[] = "WebService";
constexpr char kEnableKey[] = "Enable";
// " = " between key and value; written through a temporary file that reaches the disk before it
// replaces the settings file, so a power loss never leaves a cut file behind.
constexpr uint32_t kSettingsWriteFlags =
    kIniWriteSpacedSeparator | kIniWriteSafeReplacement | kIniWriteSync;

}  // namespace

KestConfigIni::KestConfigIni() : settings_(LoadSettings()) {}

KestConfigIni::~KestConfigIni() = default;

IniTextPtr KestConfigIni::LoadSettings() {
    IniTextPtr settings(IniText_Create());
    if (!settings) {
        throw static_cast<long>(E_OUTOFMEMORY);
    }
    IniText_SetWriteOptions(settings.get(), kIniNoMaxLineLength, 0, kSettingsWriteFlags);
    IniText_Load(settings.get(), kest::paths::WebServiceSettingsFile().c_str());
    return settings;
}

bool KestConfigIni::IsWebServiceEnabled() const {
    uint32_t enabled = 0;
    return IniText_GetUInt32(settings_.get(), kWebServiceSection, kEnableKey, &enabled) ==
               kIniFound &&
           enabled != 0;
}

void KestConfigIni::SetWebServiceEnabled(bool enabled) {
    if (IniText_SetUInt32(settings_.get(), kWebServiceSection, kEnableKey, enabled ? 1 : 0) !=
        kIniFound) {
        throw static_cast<long>(E_FAIL);
    }
    if (IniText_Save(settings_.get(), kest::paths::WebServiceSettingsFile().c_str()) != 0) {
        // Drop the unsaved change: the settings become what a fresh load of the file gives.
        settings_ = LoadSettings();
        throw static_cast<long>(E_FAIL);
    }
}

}  // namespace nVQKESTSYSAPICHASSISEXPERT100
