#include "system/KestConfigIni.h"

#include <cstdint>
#include <string>

#include "support/Exceptions.h"
#include "support/ExclusiveFileLock.h"
#include "support/Sysroot.h"
#include "support/TraceGate.h"
#include "uxsys/StatusCodes.h"

namespace nVQKESTSYSAPICHASSISEXPERT100 {
namespace {

constexpr char kWebServiceSection[] = "WebService";
constexpr char kEnableKey[] = "Enable";
// " = " between key and value; written through a temporary file that reaches the disk before it
// replaces the settings file, so a power loss never leaves a cut file behind.
constexpr uint32_t kSettingsWriteFlags =
    kIniWriteSpacedSeparator | kIniWriteSafeReplacement | kIniWriteSync;

// The lock file that orders the saves of all processes, beside the settings file in a directory
// only root writes.
std::string SaveLockFile() {
    return kest::paths::WebServiceSettingsFile() + ".lock";
}

}  // namespace

KestConfigIni::KestConfigIni() : settings_(NewDocument()) {
    // A file that cannot be read leaves the settings empty.
    LoadSettings(settings_);
}

KestConfigIni::~KestConfigIni() = default;

IniTextPtr KestConfigIni::NewDocument() {
    IniTextPtr settings(IniText_Create());
    if (!settings) {
        throw static_cast<long>(E_OUTOFMEMORY);
    }
    IniText_SetWriteOptions(settings.get(), kIniNoMaxLineLength, 0, kSettingsWriteFlags);
    return settings;
}

int KestConfigIni::LoadSettings(IniTextPtr& settings) {
    int result = IniText_Load(settings.get(), kest::paths::WebServiceSettingsFile().c_str());
    if (result == kIniInvalidArgument) {
        settings = NewDocument();
        return 0;
    }
    return result;
}

bool KestConfigIni::IsWebServiceEnabled() {
    if (IniText_HasFileChanged(settings_.get()) != 0) {
        IniTextPtr fresh = NewDocument();
        if (LoadSettings(fresh) == 0) {
            settings_ = std::move(fresh);
        }
    }
    uint32_t enabled = 0;
    return IniText_GetUInt32(settings_.get(), kWebServiceSection, kEnableKey, &enabled) ==
               kIniFound &&
           enabled != 0;
}

void KestConfigIni::SetWebServiceEnabled(bool enabled) {
    try {
        vq::dsc::osdep::ExclusiveFileLock turn(SaveLockFile());
        IniTextPtr current = NewDocument();
        int loaded = LoadSettings(current);
        if (loaded != 0) {
            // Saving now would replace content that could not be read with the switch alone.
            TraceStatus("SetWebServiceEnabled - vqkest.ini cannot be read, not saved", loaded);
            throw static_cast<long>(E_FAIL);
        }
        settings_ = std::move(current);
        if (IniText_SetUInt32(settings_.get(), kWebServiceSection, kEnableKey, enabled ? 1 : 0) !=
            kIniFound) {
            throw static_cast<long>(E_FAIL);
        }
        int saved = IniText_Save(settings_.get(), kest::paths::WebServiceSettingsFile().c_str());
        if (saved != 0) {
            TraceStatus("SetWebServiceEnabled - vqkest.ini not saved", saved);
            // Drop the unsaved change: the settings become what a fresh load of the file gives.
            settings_ = NewDocument();
            LoadSettings(settings_);
            throw static_cast<long>(E_FAIL);
        }
    } catch (const vq::dsc::osdep::PosixError& error) {
        TraceIfEnabled(
            std::string("SetWebServiceEnabled - no turn to save vqkest.ini: ") + error.what(),
            kTraceErrors);
        throw static_cast<long>(E_FAIL);
    }
}

}  // namespace nVQKESTSYSAPICHASSISEXPERT100
