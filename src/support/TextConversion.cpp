#include "support/TextConversion.h"

#include <iconv.h>
#include <langinfo.h>

#include <cerrno>
#include <cstdint>
#include <memory>
#include <string>
#include <type_traits>

#include "support/Exceptions.h"

namespace vq {
namespace dsc {
namespace {

// One iconv descriptor, opened for the process locale's character set ("" code-set name).
class IconvDescriptor {
  public:
    IconvDescriptor(const char* to, const char* from) : cd_(iconv_open(to, from)) {
        if (cd_ == reinterpret_cast<iconv_t>(-1)) {
            throw exception::InvalidLocale();
        }
    }
    ~IconvDescriptor() { iconv_close(cd_); }
    IconvDescriptor(const IconvDescriptor&) = delete;
    IconvDescriptor& operator=(const IconvDescriptor&) = delete;

    // Converts `inBytes` bytes into `out`, replacing each unconvertible input unit of
    // `unitBytes` bytes by `question` (itself `questionBytes` bytes long).
    size_t Convert(const char* in, size_t inBytes, char* out, size_t outBytes, size_t unitBytes,
                   const char* question, size_t questionBytes) {
        iconv(cd_, nullptr, nullptr, nullptr, nullptr);
        char* inPtr = const_cast<char*>(in);
        char* outPtr = out;
        size_t outLeft = outBytes;
        while (inBytes > 0) {
            if (iconv(cd_, &inPtr, &inBytes, &outPtr, &outLeft) != static_cast<size_t>(-1)) {
                break;
            }
            if (errno == E2BIG || outLeft < questionBytes) {
                break;
            }
            // EILSEQ or EINVAL: replace one unit of input and go on.
            for (size_t i = 0; i < questionBytes; ++i) {
                *outPtr++ = question[i];
            }
            outLeft -= questionBytes;
            const size_t skip = inBytes < unitBytes ? inBytes : unitBytes;
            inPtr += skip;
            inBytes -= skip;
        }
        if (outLeft > 0) {
            iconv(cd_, nullptr, nullptr, &outPtr, &outLeft);
        }
        return outBytes - outLeft;
    }

  private:
    iconv_t cd_;
};

// The calling thread's descriptor for one direction, reopened whenever the locale's character set
// has changed since it was opened (opening one costs far more than a conversion).
class CachedDescriptor {
  public:
    explicit CachedDescriptor(bool toNarrow) : toNarrow_(toNarrow) {}

    IconvDescriptor& ForCurrentLocale() {
        const char* codeset = nl_langinfo(CODESET);
        if (!descriptor_ || codeset_ != codeset) {
            descriptor_.reset();
            descriptor_ = toNarrow_ ? std::make_unique<IconvDescriptor>("", "WCHAR_T")
                                    : std::make_unique<IconvDescriptor>("WCHAR_T", "");
            codeset_ = codeset;
        }
        return *descriptor_;
    }

  private:
    bool toNarrow_;
    std::string codeset_;
    std::unique_ptr<IconvDescriptor> descriptor_;
};

// True for a code point that has an encoding: at most U+10FFFF and not a UTF-16 surrogate.
bool IsScalarValue(wchar_t character) {
    // The bits as they are: a negative wchar_t is far above U+10FFFF.
    // NOLINTNEXTLINE(bugprone-signed-char-misuse): a wide character, not a byte
    const auto value = static_cast<std::make_unsigned_t<wchar_t>>(character);
    return value <= 0x10FFFF && (value < 0xD800 || value > 0xDFFF);
}

}  // namespace

std::string NarrowFromWide(const wchar_t* text, size_t count) {
    if (count == 0) {
        return std::string();
    }
    // Characters without an encoding become '?' before conversion: the converter would give
    // them sequences that are not valid text, longer than the four bytes sized per character.
    std::wstring checked;
    for (size_t i = 0; i < count; ++i) {
        if (!IsScalarValue(text[i])) {
            checked.assign(text, count);
            break;
        }
    }
    if (!checked.empty()) {
        for (wchar_t& character : checked) {
            character = IsScalarValue(character) ? character : L'?';
        }
        text = checked.data();
    }
    thread_local CachedDescriptor toNarrow(true);
    std::string out(count * 4, '\0');
    const size_t written = toNarrow.ForCurrentLocale().Convert(reinterpret_cast<const char*>(text),
                                                               count * sizeof(wchar_t), &out[0],
                                                               out.size(), sizeof(wchar_t), "?", 1);
    out.resize(written);
    return out;
}

std::wstring WideFromNarrow(const char* text, size_t count) {
    if (count == 0) {
        return std::wstring();
    }
    thread_local CachedDescriptor toWide(false);
    std::wstring out(count, L'\0');
    const wchar_t question = L'?';
    const size_t written = toWide.ForCurrentLocale().Convert(
        text, count, reinterpret_cast<char*>(&out[0]), out.size() * sizeof(wchar_t), 1,
        reinterpret_cast<const char*>(&question), sizeof(question));
    out.resize(written / sizeof(wchar_t));
    // A sequence the converter decodes beyond U+10FFFF (F4 90 80 80 and above) has no character.
    for (wchar_t& character : out) {
        character = IsScalarValue(character) ? character : L'?';
    }
    return out;
}

}  // namespace dsc
}  // namespace vq
