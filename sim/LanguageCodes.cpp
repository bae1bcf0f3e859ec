#include "LanguageCodes.h"

namespace kest::sim {
namespace {

struct Language {
    const char* name;
    const char* code;
};

constexpr Language kBuiltInLanguages[] = {
    {"English", "en"}, {"German", "de"}, {"French", "fr"},
    {"Chinese", "zh"}, {"Korean", "kr"}, {"Japanese", "ja"},
};

}  // namespace

std::string LanguageNameForCode(const ControllerState& state, const std::string& localeCode) {
    if (localeCode.empty()) {
        return std::string();
    }
    for (const auto& entry : state.Document().Entries("Languages")) {
        if (entry.second == localeCode) {
            return entry.first;
        }
    }
    for (const Language& language : kBuiltInLanguages) {
        if (localeCode == language.code) {
            return language.name;
        }
    }
    return std::string();
}

}  // namespace kest::sim
