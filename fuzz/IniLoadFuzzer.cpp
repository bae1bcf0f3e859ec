// Loads arbitrary bytes as an INI file under fuzzed read and name options, reads every key back
// through every getter, then saves the document under fuzzed write options and checks that
// loading the saved file gives the same sections, keys and values in the same order.
//
// Input: byte 0 holds the read flags (low five bits) and the byte-order-mark write flag (bit 5);
// byte 1 the name options (bits 0-1), the maximum line length (bits 2-4), the split character
// (bits 5-6) and the spaced separator (bit 7); the rest is the file.
#include <algorithm>
#include <cctype>
#include <cerrno>
#include <cstdint>
#include <cstdlib>
#include <cstring>
#include <set>
#include <string>
#include <utility>
#include <vector>

#include "FuzzCheck.h"
#include "MemoryFile.h"
#include "config/IniText.h"
#include "config/IniTextPtr.h"

namespace {

struct Options {
    uint32_t readFlags;
    bool uniqueNames;
    bool caseSensitive;
    int maxLineLength;
    char splitCharacter;
    uint32_t writeFlags;
};

Options DecodeOptions(uint8_t first, uint8_t second) {
    static const int kMaxLineLengths[] = {kIniNoMaxLineLength, 0, 1, 13, 20, 40, 80, 300};
    static const char kSplitCharacters[] = {0, ',', ' ', '"'};
    const uint32_t readFlags = first & 0x1F;
    const uint32_t writeFlags = ((second & 0x80) != 0 ? kIniWriteSpacedSeparator : 0) |
                                ((first & 0x20) != 0 ? kIniWriteByteOrderMark : 0) |
                                ((readFlags & kIniReadKeepComments) != 0 ? kIniWriteComments : 0);
    return {readFlags,
            (second & 0x01) != 0,
            (second & 0x02) != 0,
            kMaxLineLengths[(second >> 2) & 0x07],
            kSplitCharacters[(second >> 5) & 0x03],
            writeFlags};
}

using Keys = std::vector<std::pair<std::string, std::string>>;
using Snapshot = std::vector<std::pair<std::string, Keys>>;

Snapshot Take(const IniText* ini) {
    Snapshot snapshot;
    const int sections = IniText_GetSectionCount(ini);
    for (int s = 1; s <= sections; ++s) {
        const char* section = nullptr;
        FUZZ_CHECK(IniText_GetSectionName(ini, s, &section) == kIniFound);
        Keys keys;
        const int count = IniText_GetKeyCount(ini, section);
        for (int k = 1; k <= count; ++k) {
            const char* key = nullptr;
            const char* value = nullptr;
            FUZZ_CHECK(IniText_GetKeyByIndex(ini, section, k, &key, &value) == kIniFound);
            keys.emplace_back(key, value);
        }
        FUZZ_CHECK(IniText_GetKeyByIndex(ini, section, count + 1, nullptr, nullptr) ==
                   kIniNotFound);
        snapshot.emplace_back(section, std::move(keys));
    }
    return snapshot;
}

// The name as look-ups compare it.
std::string Folded(std::string name, bool caseSensitive) {
    for (char& c : name) {
        c = caseSensitive ? c : static_cast<char>(std::toupper(static_cast<unsigned char>(c)));
    }
    return name;
}

bool IsBlank(const std::string& text) {
    return text.find_first_not_of(" \t\n\v\f\r") == std::string::npos;
}

// The value of `text` when it is an optional sign and decimal digits around blanks.
bool ReferenceInteger(const std::string& text, long long* value) {
    const char* begin = text.c_str();
    while (std::isspace(static_cast<unsigned char>(*begin))) {
        ++begin;
    }
    const char* digits = begin + (*begin == '+' || *begin == '-');
    if (!std::isdigit(static_cast<unsigned char>(*digits))) {
        return false;
    }
    char* end = nullptr;
    errno = 0;
    *value = std::strtoll(begin, &end, 10);
    while (std::isspace(static_cast<unsigned char>(*end))) {
        ++end;
    }
    return errno == 0 && *end == '\0';
}

void CheckIntegers(IniText* ini, const char* section, const char* key, const std::string& value) {
    long long expected = 0;
    const bool isInteger = ReferenceInteger(value, &expected);
    int32_t signedValue = 0;
    const int signedResult = IniText_GetInt32(ini, section, key, &signedValue);
    uint32_t unsignedValue = 0;
    const int unsignedResult = IniText_GetUInt32(ini, section, key, &unsignedValue);
    if (IsBlank(value)) {
        FUZZ_CHECK(signedResult == kIniNotFound && unsignedResult == kIniNotFound);
        return;
    }
    const bool fitsSigned = isInteger && expected >= INT32_MIN && expected <= INT32_MAX;
    // A minus sign rules out an unsigned value, even for "-0".
    const bool fitsUnsigned = isInteger && value.find('-') == std::string::npos &&
                              expected <= static_cast<long long>(UINT32_MAX);
    FUZZ_CHECK(signedResult == (fitsSigned ? kIniFound : kIniNotInt32));
    FUZZ_CHECK(!fitsSigned || signedValue == expected);
    FUZZ_CHECK(unsignedResult == (fitsUnsigned ? kIniFound : kIniNotUInt32));
    FUZZ_CHECK(unsignedResult != kIniFound || unsignedValue == expected);
}

void CheckOtherGetters(IniText* ini, const char* section, const char* key,
                       const std::string& value) {
    for (size_t size :
         {size_t{1}, size_t{2}, size_t{7}, std::max<size_t>(value.size(), 1), value.size() + 1}) {
        std::string buffer(size + 1, '\x7f');
        FUZZ_CHECK(IniText_GetStringIntoBuffer(ini, section, key, &buffer[0], size) == kIniFound);
        const size_t copied = std::min(value.size(), size - 1);
        FUZZ_CHECK(buffer.compare(0, copied, value, 0, copied) == 0);
        FUZZ_CHECK(buffer[copied] == '\0' && buffer[size] == '\x7f');
    }
    char untouched = 'u';
    FUZZ_CHECK(IniText_GetStringIntoBuffer(ini, section, key, &untouched, 0) == kIniFound);
    FUZZ_CHECK(untouched == 'u');

    char* copy = nullptr;
    FUZZ_CHECK(IniText_GetStringCopy(ini, section, key, &copy) == kIniFound);
    FUZZ_CHECK(value == copy);
    std::free(copy);

    const char* decoded = nullptr;
    FUZZ_CHECK(IniText_GetEscapedString(ini, section, key, &decoded) == kIniFound);
    FUZZ_CHECK(std::strlen(decoded) <= value.size());

    bool flag = false;
    const int booleanResult = IniText_GetBoolean(ini, section, key, &flag);
    double number = 0;
    const int doubleResult = IniText_GetDouble(ini, section, key, &number);
    if (IsBlank(value)) {
        FUZZ_CHECK(booleanResult == kIniNotFound && doubleResult == kIniNotFound);
    } else {
        FUZZ_CHECK(booleanResult == kIniFound || booleanResult == kIniNotBoolean);
        FUZZ_CHECK(doubleResult == kIniFound || doubleResult == kIniNotDouble);
    }
}

// Every getter, by name, for every key; a look-up finds the first key of a name in the first
// section of its name.
void CheckGetters(IniText* ini, const Snapshot& snapshot, bool caseSensitive) {
    std::set<std::string> sections;
    for (const auto& [section, keys] : snapshot) {
        const bool firstSection = sections.insert(Folded(section, caseSensitive)).second;
        std::set<std::string> names;
        for (const auto& [key, value] : keys) {
            const char* found = nullptr;
            FUZZ_CHECK(IniText_GetString(ini, section.c_str(), key.c_str(), &found) == kIniFound);
            if (names.insert(Folded(key, caseSensitive)).second && firstSection) {
                FUZZ_CHECK(value == found);
                CheckOtherGetters(ini, section.c_str(), key.c_str(), value);
                CheckIntegers(ini, section.c_str(), key.c_str(), value);
            }
        }
    }
}

IniTextPtr Load(const MemoryFile& file, const Options& options, int* result) {
    IniTextPtr ini(IniText_Create());
    FUZZ_CHECK(ini != nullptr);
    IniText_SetNameOptions(ini.get(), options.uniqueNames, options.caseSensitive);
    IniText_SetReadOptions(ini.get(), options.readFlags);
    *result = IniText_Load(ini.get(), file.Path());
    return ini;
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    if (size < 2) {
        return 0;
    }
    static const MemoryFile source;
    static const MemoryFile saved;
    const Options options = DecodeOptions(data[0], data[1]);
    source.Replace(std::string_view(reinterpret_cast<const char*>(data) + 2, size - 2));

    int loaded = 0;
    IniTextPtr ini = Load(source, options, &loaded);
    FUZZ_CHECK(loaded == 0 || loaded == kIniUnsupportedEncoding);
    const Snapshot snapshot = Take(ini.get());
    FUZZ_CHECK(loaded == 0 || snapshot.empty());
    CheckGetters(ini.get(), snapshot, options.caseSensitive);

    FUZZ_CHECK(IniText_SetWriteOptions(ini.get(), options.maxLineLength, options.splitCharacter,
                                       options.writeFlags) == kIniFound);
    const int written = IniText_Save(ini.get(), saved.Path());
    if (written == kIniNoRoomToSplit) {
        return 0;
    }
    FUZZ_CHECK(written == 0);
    int reloaded = 0;
    IniTextPtr again = Load(saved, options, &reloaded);
    FUZZ_CHECK(reloaded == 0);
    FUZZ_CHECK(Take(again.get()) == snapshot);
    return 0;
}
