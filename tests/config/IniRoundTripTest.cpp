// Property: for generated documents and write options, saving and loading again gives back the
// same sections, keys and values in the same order.
#include <random>
#include <string>
#include <utility>
#include <vector>

#include "IniTestSupport.h"

using kest::test::TempSysroot;

namespace {

struct Snapshot {
    struct Section {
        std::string name;
        std::vector<std::pair<std::string, std::string>> keys;
        bool operator==(const Section& other) const {
            return name == other.name && keys == other.keys;
        }
    };
    std::vector<Section> sections;
};

void PrintTo(const Snapshot::Section& section, std::ostream* out) {
    *out << "[" << section.name << "] " << ::testing::PrintToString(section.keys);
}

Snapshot Take(const IniText* ini) {
    Snapshot snapshot;
    for (int s = 1; s <= IniText_GetSectionCount(ini); ++s) {
        const char* name = nullptr;
        IniText_GetSectionName(ini, s, &name);
        Snapshot::Section section{name, {}};
        const char* lookup = std::string(name) == kIniUnnamedSection ? nullptr : name;
        for (int k = 1; k <= IniText_GetKeyCount(ini, lookup); ++k) {
            const char* key = nullptr;
            const char* value = nullptr;
            IniText_GetKeyByIndex(ini, lookup, k, &key, &value);
            section.keys.emplace_back(key, value);
        }
        snapshot.sections.push_back(std::move(section));
    }
    return snapshot;
}

class DocumentGenerator {
  public:
    explicit DocumentGenerator(uint32_t seed) : random_(seed) {}

    // Fills `ini` and returns the read flags needed to read it back.
    uint32_t Fill(IniText* ini) {
        bool unnamed = Chance(4);
        uint32_t readFlags = kIniReadKeepEmptyValues | kIniReadStripDoubleQuotes |
                             kIniReadStripApostrophes |
                             (unnamed ? kIniReadColonsAndUnnamedSection : 0);
        int sections = Number(0, 5);
        for (int s = 0; s < sections; ++s) {
            std::string section = Text("abcdefghijklmnopqrstuvwxyzABCXYZ0123456789 _.-", 1, 10);
            bool useUnnamed = unnamed && s == 0;
            int keys = Number(useUnnamed ? 1 : 0, 6);
            for (int k = 0; k < keys; ++k) {
                std::string key = Text("abcdefghijklmnopqrstuvwxyz0123456789 _.-", 1, 10);
                const char* sectionName = useUnnamed ? nullptr : section.c_str();
                SetValue(ini, sectionName, key.c_str());
            }
            if (keys == 0) {
                // A section without keys: create it through a key and remove the key.
                IniText_SetRaw(ini, section.c_str(), "placeholder", "x", 0);
                IniText_DeleteKey(ini, section.c_str(), "placeholder");
            }
        }
        return readFlags;
    }

    // Random write options that every generated document can be saved with.
    void ChooseWriteOptions(IniText* ini) {
        const int lengths[] = {kIniNoMaxLineLength, 80, 50};
        const char splits[] = {0, ',', ' '};
        uint32_t flags = 0;
        for (uint32_t bit : {kIniWriteByteOrderMark, kIniWriteSafeReplacement,
                             kIniWriteUniqueTemporary, kIniWriteSpacedSeparator, kIniWriteSync}) {
            flags |= Chance(2) ? bit : 0;
        }
        IniText_SetWriteOptions(ini, lengths[Number(0, 2)], splits[Number(0, 2)], flags);
    }

  private:
    void SetValue(IniText* ini, const char* section, const char* key) {
        std::string value = Text("abcdefghij KLMNOP 0123 \"'=;[],\\:#\t\xC3\xA9", 0, 150);
        switch (Number(0, 3)) {
            case 0:
                if (!EnclosedInQuotes(value)) {
                    ASSERT_EQ(IniText_SetRaw(ini, section, key, value.c_str(), 0), kIniFound);
                    break;
                }
                [[fallthrough]];
            case 1:
                ASSERT_EQ(IniText_SetRaw(ini, section, key, value.c_str(), '"'), kIniFound);
                break;
            case 2:
                ASSERT_EQ(IniText_SetRaw(ini, section, key, value.c_str(), '\''), kIniFound);
                break;
            default:
                value += "\n\x01";
                ASSERT_EQ(IniText_SetString(ini, section, key, value.c_str(), true), kIniFound);
                break;
        }
    }

    // An unquoted value enclosed in a pair of quote characters is read as a quoted one: that is
    // the format, not a loss, so such values are written with quotes.
    static bool EnclosedInQuotes(const std::string& value) {
        std::string_view trimmed = value;
        while (!trimmed.empty() && (trimmed.front() == ' ' || trimmed.front() == '\t')) {
            trimmed.remove_prefix(1);
        }
        while (!trimmed.empty() && (trimmed.back() == ' ' || trimmed.back() == '\t')) {
            trimmed.remove_suffix(1);
        }
        return trimmed.size() >= 2 && trimmed.front() == trimmed.back() &&
               (trimmed.front() == '"' || trimmed.front() == '\'');
    }

    int Number(int low, int high) { return std::uniform_int_distribution<int>(low, high)(random_); }
    bool Chance(int oneIn) { return Number(1, oneIn) == 1; }

    std::string Text(const std::string& alphabet, int minimum, int maximum) {
        for (;;) {
            std::string text;
            int length = Number(minimum, maximum);
            for (int i = 0; i < length; ++i) {
                text += alphabet[static_cast<size_t>(Number(0, int(alphabet.size()) - 1))];
            }
            bool blank = text.find_first_not_of(" \t") == std::string::npos;
            if (minimum == 0 || !blank) {
                return text;
            }
        }
    }

    std::mt19937 random_;
};

TEST(IniRoundTripTest, SaveThenLoadGivesBackTheDocument) {
    TempSysroot dir;
    std::string path = dir.PathOf("/round.ini");
    for (uint32_t seed = 1; seed <= 400; ++seed) {
        DocumentGenerator generator(seed);
        IniTextPtr original = NewIniText();
        uint32_t readFlags = generator.Fill(original.get());
        if (HasFatalFailure()) {
            return;
        }
        generator.ChooseWriteOptions(original.get());
        ASSERT_EQ(IniText_Save(original.get(), path.c_str()), 0) << "seed " << seed;
        IniTextPtr loaded = NewIniText();
        IniText_SetReadOptions(loaded.get(), readFlags);
        ASSERT_EQ(IniText_Load(loaded.get(), path.c_str()), 0) << "seed " << seed;
        ASSERT_EQ(Take(loaded.get()).sections, Take(original.get()).sections)
            << "seed " << seed << "\n"
            << ReadBytes(path);
    }
}

}  // namespace
