// vq::targetcfg::system: the [System] section of the state file.
#include <string>
#include <vector>

#include "LanguageCodes.h"
#include "SimulatedCall.h"
#include "StateStore.h"
#include "ZoneDatabase.h"
#include "vq/targetcfg/System.h"

namespace vq {
namespace targetcfg {
namespace system {
namespace {

using kest::sim::CallArguments;
using kest::sim::ControllerState;
using kest::sim::NoInputs;
using kest::sim::RunCall;

constexpr char kSystem[] = "System";

// A getter of the text under `key`; the empty text when it is absent.
int32_t GetText(const char* callName, const char* key, NarrowString& output) {
    return RunCall(callName, NoInputs, [&](ControllerState& state) {
        std::string text;
        state.GetText(kSystem, key, text);
        output = text;
        return status::kSuccess;
    });
}

// A getter of the number under `key`; the output stays unchanged when it is absent.
int32_t GetUnsigned(const char* callName, const char* key, uint32_t& output) {
    return RunCall(callName, NoInputs, [&](ControllerState& state) {
        uint32_t value = output;
        state.GetUnsigned(kSystem, key, value);
        output = value;
        return status::kSuccess;
    });
}

// A setter that stores `text` under `key`.
int32_t SetText(const char* callName, const char* key, const NarrowString& text) {
    return RunCall(
        callName, [&](CallArguments& arguments) { arguments.Text(text.str()); },
        [&](ControllerState& state) {
            state.SetText(kSystem, key, text.str());
            return status::kSuccess;
        });
}

// The names of a comma-separated list; an empty text has none.
std::vector<std::string> SplitNames(const std::string& text) {
    std::vector<std::string> names;
    if (text.empty()) {
        return names;
    }
    size_t start = 0;
    for (;;) {
        const size_t comma = text.find(',', start);
        names.push_back(text.substr(start, comma - start));
        if (comma == std::string::npos) {
            return names;
        }
        start = comma + 1;
    }
}

}  // namespace

int32_t GetDeviceDescription(NarrowString& description) {
    return GetText("GetDeviceDescription", "DeviceDescription", description);
}

int32_t GetTargetClass(NarrowString& targetClass) {
    return GetText("GetTargetClass", "TargetClass", targetClass);
}

int32_t GetHostName(NarrowString& hostName) {
    return GetText("GetHostName", "HostName", hostName);
}

int32_t GetTargetID(uint32_t& targetId) {
    return GetUnsigned("GetTargetID", "TargetID", targetId);
}

int32_t GetSerialNumber(uint32_t& serialNumber) {
    return GetUnsigned("GetSerialNumber", "SerialNumber", serialNumber);
}

int32_t GetUserComment(WideString& comment) {
    return RunCall("GetUserComment", NoInputs, [&](ControllerState& state) {
        std::string text;
        state.GetText(kSystem, "UserComment", text);
        comment = WideString(text);
        return status::kSuccess;
    });
}

int32_t GetLanguageName(NarrowString& languageName) {
    return GetText("GetLanguageName", "LanguageName", languageName);
}

int32_t GetSupportedLanguages(vq::dsc::Vector<NarrowString>& languageNames) {
    return RunCall("GetSupportedLanguages", NoInputs, [&](ControllerState& state) {
        std::string text;
        state.GetText(kSystem, "SupportedLanguages", text);
        const std::vector<std::string> names = SplitNames(text);
        vq::dsc::Vector<NarrowString> appended(languageNames);
        for (const std::string& name : names) {
            appended.push_back(NarrowString(name));
        }
        languageNames.swap(appended);
        return status::kSuccess;
    });
}

int32_t GetTimeZone(NarrowString& timeZone) {
    return GetText("GetTimeZone", "TimeZone", timeZone);
}

int32_t GetTimezoneOffset() {
    return RunCall("GetTimezoneOffset", NoInputs, [](ControllerState& state) {
        int32_t offset = 0;
        state.GetSigned(kSystem, "TimezoneOffset", offset);
        return offset;
    });
}

int32_t SetHostName(NarrowString hostName) {
    return SetText("SetHostName", "HostName", hostName);
}

int32_t SetUserComment(NarrowString comment) {
    return SetText("SetUserComment", "UserComment", comment);
}

int32_t SetLanguageName(NarrowString localeCode) {
    return RunCall(
        "SetLanguageName", [&](CallArguments& arguments) { arguments.Text(localeCode.str()); },
        [&](ControllerState& state) {
            const std::string name = kest::sim::LanguageNameForCode(state, localeCode.str());
            if (name.empty()) {
                return status::kValueInvalid;
            }
            state.SetText(kSystem, "LanguageName", name);
            return status::kSuccess;
        });
}

int32_t SetTimeZone(NarrowString timeZone) {
    return SetText("SetTimeZone", "TimeZone", timeZone);
}

int32_t ValidateTimeZone(NarrowString timeZone) {
    return RunCall(
        "ValidateTimeZone", [&](CallArguments& arguments) { arguments.Text(timeZone.str()); },
        [&](ControllerState&) {
            return kest::sim::ZoneFileExists(kest::sim::CurrentSysroot().value_or(""),
                                             timeZone.str())
                       ? status::kSuccess
                       : status::kValueInvalid;
        });
}

}  // namespace system
}  // namespace targetcfg
}  // namespace vq
