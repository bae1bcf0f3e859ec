#include "config/IniText.h"

#include <sys/stat.h>

#include <algorithm>
#include <cerrno>
#include <cstdarg>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <new>
#include <string>
#include <string_view>

#include "config/IniDocument.h"
#include "config/IniReader.h"
#include "config/IniValues.h"
#include "config/IniWriter.h"

struct IniText {
    kest::ini::IniDocument document;
    uint32_t readFlags = kIniDefaultReadFlags;
    kest::ini::WriteOptions writeOptions;
    bool hasFile = false;  // a file was loaded or saved: `path` and `stamp` describe it
    std::string path;
    kest::ini::FileStamp stamp;  // of the version loaded or saved
    std::string decoded;         // scratch buffer of IniText_GetEscapedString
};

namespace {

using kest::ini::IniKey;
using kest::ini::IniSection;
using kest::ini::TrimIniSpace;

// Scratch buffers larger than the need by more than this are given back.
constexpr size_t kScratchSlack = 1024;
constexpr size_t kScratchMinimum = 256;

// Runs `body`, turning an allocation failure into -12.
template <class Body>
int Guarded(Body&& body) noexcept {
    try {
        return body();
    } catch (const std::bad_alloc&) {
        return kIniOutOfMemory;
    }
}

bool HasLineBreak(std::string_view text) {
    return text.find_first_of("\r\n") != std::string_view::npos;
}

// True when reading strips the first and last character as a pair of double quotes.
bool EnclosedInDoubleQuotes(std::string_view value) {
    return value.size() >= 2 && value.front() == '"' && value.back() == '"';
}

// 1 when section, key and value would read back as given, else the engine failure.
int CheckWritable(const char* section, const char* key, const char* value, char quote) {
    if ((section != nullptr && TrimIniSpace(section).empty()) || key == nullptr ||
        TrimIniSpace(key).empty()) {
        return kIniEmptyName;
    }
    std::string_view keyName = TrimIniSpace(key);
    bool readable =
        (section == nullptr || (!HasLineBreak(section) && std::strchr(section, ']') == nullptr)) &&
        !HasLineBreak(keyName) && keyName.find('=') == std::string_view::npos &&
        keyName.front() != '[' && keyName.front() != ';' && !HasLineBreak(value) &&
        (quote == '"' || (quote == 0 && !EnclosedInDoubleQuotes(TrimIniSpace(value))));
    return readable ? kIniFound : kIniInvalidArgument;
}

const IniKey* FindKey(const IniText* ini, const char* section, const char* key) {
    return ini->document.FindKey(section, key);
}

// Looks the key up and converts its value with `parse`.
template <class Value, class Parse>
int GetConverted(const IniText* ini, const char* section, const char* key, Value* value,
                 Parse parse) {
    const IniKey* found = FindKey(ini, section, key);
    return found == nullptr ? kIniNotFound : parse(found->value, value);
}

int SetFormatted(IniText* ini, const char* section, const char* key, const char* format, ...)
    __attribute__((format(printf, 4, 5)));

int SetFormatted(IniText* ini, const char* section, const char* key, const char* format, ...) {
    char text[64];
    va_list arguments;
    va_start(arguments, format);
    std::vsnprintf(text, sizeof text, format, arguments);
    va_end(arguments);
    return IniText_SetRaw(ini, section, key, text, 0);
}

}  // namespace

IniText* IniText_Create() {
    return new (std::nothrow) IniText();
}

void IniText_Destroy(IniText* ini) {
    delete ini;
}

void IniText_SetReadOptions(IniText* ini, uint32_t readFlags) {
    ini->readFlags = readFlags;
}

int IniText_SetWriteOptions(IniText* ini, int maxLineLength, int splitCharacter,
                            uint32_t writeFlags) {
    if (splitCharacter < 0 || splitCharacter >= 128) {
        return kIniNotInt32;
    }
    ini->writeOptions.maxLineLength = maxLineLength;
    ini->writeOptions.splitCharacter = static_cast<char>(splitCharacter);
    ini->writeOptions.flags = writeFlags;
    return kIniFound;
}

void IniText_SetNameOptions(IniText* ini, bool uniqueNames, bool caseSensitive) {
    ini->document.SetNameOptions(uniqueNames, caseSensitive);
}

int IniText_Load(IniText* ini, const char* path) {
    return Guarded([&] {
        kest::ini::IniDocument fresh(ini->document.UniqueNames(), ini->document.CaseSensitive());
        kest::ini::FileStamp stamp;
        int result = kest::ini::ReadIniFile(path, ini->readFlags, fresh, &stamp);
        if (result < 0) {
            return result;
        }
        ini->path = path;
        ini->document = std::move(fresh);
        ini->stamp = stamp;
        ini->hasFile = true;
        return 0;
    });
}

int IniText_Save(IniText* ini, const char* path) {
    if (path == nullptr || *path == '\0') {
        return kIniInvalidArgument;
    }
    return Guarded([&] {
        std::string text;
        int result = kest::ini::FormatIni(ini->document, ini->writeOptions, text);
        kest::ini::FileStamp stamp;
        if (result == 0) {
            result = kest::ini::WriteIniFile(path, text, ini->writeOptions.flags, &stamp);
        }
        if (result < 0) {
            return result;
        }
        ini->path = path;
        ini->stamp = stamp;
        ini->hasFile = true;
        return 0;
    });
}

int IniText_HasFileChanged(const IniText* ini) {
    if (!ini->hasFile) {
        return kIniInvalidArgument;
    }
    struct stat status;
    if (stat(ini->path.c_str(), &status) != 0) {
        return errno == ENOENT ? kIniInvalidArgument : kIniCannotOpenForReading;
    }
    return kest::ini::FileStamp::Of(status) == ini->stamp ? 0 : 1;
}

int IniText_GetString(const IniText* ini, const char* section, const char* key,
                      const char** value) {
    const IniKey* found = FindKey(ini, section, key);
    if (found == nullptr) {
        return kIniNotFound;
    }
    *value = found->value.c_str();
    return kIniFound;
}

int IniText_GetStringIntoBuffer(const IniText* ini, const char* section, const char* key,
                                char* buffer, size_t bufferSize) {
    const IniKey* found = FindKey(ini, section, key);
    if (found == nullptr) {
        return kIniNotFound;
    }
    if (bufferSize > 0) {
        size_t length = std::min(found->value.size(), bufferSize - 1);
        std::memcpy(buffer, found->value.data(), length);
        buffer[length] = '\0';
    }
    return kIniFound;
}

int IniText_GetStringCopy(const IniText* ini, const char* section, const char* key, char** value) {
    const IniKey* found = FindKey(ini, section, key);
    if (found == nullptr) {
        return kIniNotFound;
    }
    char* copy = static_cast<char*>(std::malloc(found->value.size() + 1));
    if (copy == nullptr) {
        return kIniOutOfMemory;
    }
    std::memcpy(copy, found->value.c_str(), found->value.size() + 1);
    *value = copy;
    return kIniFound;
}

int IniText_GetEscapedString(IniText* ini, const char* section, const char* key,
                             const char** value) {
    const IniKey* found = FindKey(ini, section, key);
    if (found == nullptr) {
        return kIniNotFound;
    }
    return Guarded([&] {
        size_t needed = found->value.size() + 1;
        if (ini->decoded.capacity() > needed + kScratchSlack) {
            std::string smaller;
            smaller.reserve(std::max(needed, kScratchMinimum));
            ini->decoded.swap(smaller);
        }
        kest::ini::DecodeEscapes(found->value, ini->decoded);
        *value = ini->decoded.c_str();
        return kIniFound;
    });
}

int IniText_GetUInt32(const IniText* ini, const char* section, const char* key, uint32_t* value) {
    return GetConverted(ini, section, key, value, kest::ini::ParseUInt32);
}

int IniText_GetInt32(const IniText* ini, const char* section, const char* key, int32_t* value) {
    return GetConverted(ini, section, key, value, kest::ini::ParseInt32);
}

int IniText_GetBoolean(const IniText* ini, const char* section, const char* key, bool* value) {
    return GetConverted(ini, section, key, value, kest::ini::ParseBoolean);
}

int IniText_GetDouble(const IniText* ini, const char* section, const char* key, double* value) {
    return GetConverted(ini, section, key, value, kest::ini::ParseDouble);
}

int IniText_SetRaw(IniText* ini, const char* section, const char* key, const char* value,
                   char quoteMark) {
    if (value == nullptr) {
        value = "";
    }
    int checked = CheckWritable(section, key, value, quoteMark);
    if (checked < 0) {
        return checked;
    }
    return Guarded([&] {
        IniSection& owner = ini->document.ObtainSection(section);
        IniKey& entry = ini->document.ObtainKey(owner, key);
        std::string_view trimmed = TrimIniSpace(value);
        entry.value.assign(trimmed.data(), trimmed.size());
        entry.quote = quoteMark;
        return kIniFound;
    });
}

int IniText_SetString(IniText* ini, const char* section, const char* key, const char* value,
                      bool escape) {
    if (!escape || value == nullptr) {
        return IniText_SetRaw(ini, section, key, value, '"');
    }
    return Guarded([&] {
        std::string encoded = kest::ini::EncodeEscapes(value);
        return IniText_SetRaw(ini, section, key, encoded.c_str(), '"');
    });
}

int IniText_SetUInt32(IniText* ini, const char* section, const char* key, uint32_t value) {
    return SetFormatted(ini, section, key, "%u", value);
}

int IniText_SetInt32(IniText* ini, const char* section, const char* key, int32_t value) {
    return SetFormatted(ini, section, key, "%d", value);
}

int IniText_SetDouble(IniText* ini, const char* section, const char* key, double value) {
    return SetFormatted(ini, section, key, "%.14e", value);
}

int IniText_DeleteKey(IniText* ini, const char* section, const char* key) {
    return Guarded(
        [&] { return ini->document.DeleteKey(section, key) ? kIniFound : kIniNotFound; });
}

int IniText_DeleteSection(IniText* ini, const char* section) {
    return ini->document.DeleteSection(section) ? kIniFound : kIniNotFound;
}

int IniText_GetSectionCount(const IniText* ini) {
    return static_cast<int>(ini->document.SectionCount());
}

int IniText_GetSectionName(const IniText* ini, int index, const char** name) {
    if (index < 1 || static_cast<size_t>(index) > ini->document.SectionCount()) {
        return kIniNotFound;
    }
    *name = ini->document.SectionAt(static_cast<size_t>(index) - 1).name.c_str();
    return kIniFound;
}

int IniText_GetKeyCount(const IniText* ini, const char* section) {
    const IniSection* found = ini->document.FindSection(section);
    return found == nullptr ? 0 : static_cast<int>(found->keys.Size());
}

int IniText_GetKeyByIndex(const IniText* ini, const char* section, int index, const char** key,
                          const char** value) {
    const IniSection* found = ini->document.FindSection(section);
    if (found == nullptr || index < 1 || static_cast<size_t>(index) > found->keys.Size()) {
        return kIniNotFound;
    }
    const IniKey& entry = found->keys.At(static_cast<size_t>(index) - 1);
    *key = entry.name.c_str();
    *value = entry.value.c_str();
    return kIniFound;
}
