// Property: for generated documents and write options, saving and loading again gives back the
// same sections, keys and values in the same order.
#include <random>
#include <string>
#include <utility>
#include <vector>

#include "IniTestSupport.h"

namespace kest::test::config {

using kest::test::TempSysroot;

namespace {

using Content = std::vector<std::pair<std::string, std::vector<std::string>>>;

// Every section name with its keys and values ("name=value"), in order.
Content ContentOf(const IniText* ini) {
    Content content;
    const char* name = nullptr;
    for (int s = 1; IniText_GetSectionName(ini, s, &name) == kIniFound; ++s) {
        content.push_back({name, {}});
        const char* section = std::string(name) == kIniUnnamedSection ? nullptr : name;
        const char* key = nullptr;
        const char* value = nullptr;
        for (int k = 1; IniText_GetKeyByIndex(ini, section, k, &key, &value) == kIniFound; ++k) {
            content.back().second.push_back(std::string(key) + "=" + value);
        }
    }
    return content;
}

class DocumentGenerator {
  public:
    explicit DocumentGenerator(uint32_t seed) : random_(seed) {}

    // Fills `ini` with random content and write options; returns the read flags to load it.
    uint32_t Fill(IniText* ini) {
        bool unnamed = Number(0, 3) == 0;
        for (int s = 0, sections = Number(0, 5); s < sections; ++s) {
            std::string section = Text("abcdefghijklmnopqrstuvwxyzABC0123456789 _.-", 1, 10);
            const char* sectionName = unnamed && s == 0 ? nullptr : section.c_str();
            // Names never contain "Line", so no key is taken for a piece of a split value.
            IniText_SetRaw(ini, sectionName, "placeholder", "x", 0);
            for (int k = 0, keys = Number(0, 6); k < keys; ++k) {
                std::string key = Text("abcdefghijklmnopqrstuvwxyz0123456789 _.-", 1, 10);
                SetValue(ini, sectionName, key.c_str());
            }
            if (sectionName != nullptr) {
                IniText_DeleteKey(ini, sectionName, "placeholder");
            }
        }
        const int lengths[] = {kIniNoMaxLineLength, 80, 50};
        const char splits[] = {0, ',', ' '};
        IniText_SetWriteOptions(ini, lengths[Number(0, 2)], splits[Number(0, 2)],
                                static_cast<uint32_t>(Number(0, 63)) & ~kIniWriteComments);
        return kIniReadKeepEmptyValues | kIniReadStripDoubleQuotes |
               (unnamed ? kIniReadColonsAndUnnamedSection : 0);
    }

  private:
    void SetValue(IniText* ini, const char* section, const char* key) {
        std::string value = Text("abcdefghij KLMNOP 0123 \"'=;[],\\:#\t\xC3\xA9", 0, 150);
        int kind = Number(0, 2);
        // An unquoted value between a pair of double quotes reads as a quoted one: that is the
        // format, so such values get the quote mark.
        std::string trimmed = value.substr(0, value.find_last_not_of(" \t") + 1);
        trimmed.erase(0, trimmed.find_first_not_of(" \t"));
        if (kind == 0 && trimmed.size() >= 2 && trimmed.front() == '"' && trimmed.back() == '"') {
            kind = 1;
        }
        int result = kind < 2
                         ? IniText_SetRaw(ini, section, key, value.c_str(), kind == 0 ? 0 : '"')
                         : IniText_SetString(ini, section, key, (value + "\n\x01").c_str(), true);
        EXPECT_EQ(result, kIniFound);
    }

    int Number(int low, int high) { return std::uniform_int_distribution<int>(low, high)(random_); }

    std::string Text(const std::string& alphabet, int minimum, int maximum) {
        std::string text;
        while (text.size() < size_t(minimum) ||
               text.find_first_not_of(" \t") == std::string::npos) {
            text.clear();
            for (int i = 0, length = Number(minimum, maximum); i < length; ++i) {
                text += alphabet[static_cast<size_t>(Number(0, int(alphabet.size()) - 1))];
            }
            if (minimum == 0) {
                break;
            }
        }
        return text;
    }

    std::mt19937 random_;
};

TEST(IniRoundTripTest, SaveThenLoadGivesBackTheDocument) {
    TempSysroot dir;
    std::string path = dir.PathOf("/round.ini");
    for (uint32_t seed = 1; seed <= 400 && !HasFailure(); ++seed) {
        DocumentGenerator generator(seed);
        IniTextPtr original(IniText_Create());
        uint32_t readFlags = generator.Fill(original.get());
        ASSERT_EQ(IniText_Save(original.get(), path.c_str()), 0) << "seed " << seed;
        IniTextPtr loaded(IniText_Create());
        IniText_SetReadOptions(loaded.get(), readFlags);
        ASSERT_EQ(IniText_Load(loaded.get(), path.c_str()), 0) << "seed " << seed;
        EXPECT_EQ(ContentOf(loaded.get()), ContentOf(original.get())) << "seed " << seed << "\n"
                                                                      << ReadBytes(path);
    }
}

}  // namespace

}  // namespace kest::test::config
