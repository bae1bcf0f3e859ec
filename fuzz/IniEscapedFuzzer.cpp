// Escaped strings: any text stored with IniText_SetString and escaping reads back through
// IniText_GetEscapedString as it was given (without surrounding spaces), both from the document
// and after a save, under fuzzed maximum line lengths and split characters, and reloads as it
// was saved. The decoder also meets arbitrary text set raw.
//
// Input: byte 0 chooses the maximum line length (bits 0-2) and split character (bits 3-4);
// the rest, up to the first zero byte, is the text.
#include <cstdint>
#include <cstring>
#include <string>

#include "FuzzCheck.h"
#include "MemoryFile.h"
#include "config/IniNames.h"
#include "config/IniText.h"
#include "config/IniTextPtr.h"

namespace {

constexpr const char* kSection = "Escaped";
constexpr const char* kKey = "Text";
constexpr const char* kRawKey = "Raw";

std::string WithoutSurroundingSpaces(const std::string& text) {
    const size_t begin = text.find_first_not_of(' ');
    if (begin == std::string::npos) {
        return std::string();
    }
    return text.substr(begin, text.find_last_not_of(' ') - begin + 1);
}

std::string Escaped(IniText* ini, const char* key) {
    const char* value = nullptr;
    FUZZ_CHECK(IniText_GetEscapedString(ini, kSection, key, &value) == kIniFound);
    return value;
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    if (size < 1) {
        return 0;
    }
    static const int kMaxLineLengths[] = {kIniNoMaxLineLength, 14, 15, 16, 17, 20, 33, 80};
    static const char kSplitCharacters[] = {0, '\\', 'x', ' '};
    static const MemoryFile saved;
    const int maxLineLength = kMaxLineLengths[data[0] & 0x07];
    const char splitCharacter = kSplitCharacters[(data[0] >> 3) & 0x03];
    const std::string text(reinterpret_cast<const char*>(data) + 1,
                           strnlen(reinterpret_cast<const char*>(data) + 1, size - 1));
    const std::string expected = WithoutSurroundingSpaces(text);

    IniTextPtr ini(IniText_Create());
    FUZZ_CHECK(IniText_SetString(ini.get(), kSection, kKey, text.c_str(), true) == kIniFound);
    FUZZ_CHECK(Escaped(ini.get(), kKey) == expected);

    // A raw value is refused when it would not read back: a line break, or double quotes around
    // it, which the cache's read options strip.
    const int raw = IniText_SetRaw(ini.get(), kSection, kRawKey, text.c_str(), 0);
    const bool hasLineBreak = text.find_first_of("\r\n") != std::string::npos;
    const std::string_view trimmed = kest::ini::TrimIniSpace(text);
    const bool quoted = trimmed.size() >= 2 && trimmed.front() == '"' && trimmed.back() == '"';
    FUZZ_CHECK(raw == (hasLineBreak || quoted ? kIniInvalidArgument : kIniFound));
    if (raw == kIniFound) {
        FUZZ_CHECK(Escaped(ini.get(), kRawKey).size() <= text.size());
    }

    FUZZ_CHECK(IniText_SetWriteOptions(ini.get(), maxLineLength, splitCharacter, 0) == kIniFound);
    const int written = IniText_Save(ini.get(), saved.Path());
    if (written == kIniNoRoomToSplit) {
        return 0;
    }
    FUZZ_CHECK(written == 0);
    IniTextPtr again(IniText_Create());
    FUZZ_CHECK(IniText_Load(again.get(), saved.Path()) == 0);
    FUZZ_CHECK(Escaped(again.get(), kKey) == expected);
    if (raw == kIniFound) {
        const char* before = nullptr;
        const char* after = nullptr;
        IniText_GetString(ini.get(), kSection, kRawKey, &before);
        const int found = IniText_GetString(again.get(), kSection, kRawKey, &after);
        // A blank raw value is written as an empty one, which the default read options drop.
        const std::string stored = before;
        FUZZ_CHECK(found == kIniFound ? stored == after : stored.empty());
    }
    return 0;
}
