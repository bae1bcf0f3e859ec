#include "config/IniReader.h"

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cerrno>
#include <string>
#include <unordered_map>
#include <utility>
#include <vector>

#include "config/IniText.h"
#include "support/FileDescriptor.h"
#include "support/WholeTransfer.h"

namespace kest::ini {
namespace {

constexpr std::string_view kLineSuffix = " Line";

bool IsLineEnd(char c) {
    return c == '\n' || c == '\r' || c == '\0';
}

// The number of a key named base " Line" digits, or false for any other name.
bool LineNumber(std::string_view name, uint32_t* number, size_t* baseLength) {
    size_t digits = name.size();
    while (digits > 0 && name[digits - 1] >= '0' && name[digits - 1] <= '9') {
        --digits;
    }
    if (digits == name.size() || digits < kLineSuffix.size() ||
        name.substr(digits - kLineSuffix.size(), kLineSuffix.size()) != kLineSuffix) {
        return false;
    }
    uint64_t value = 0;
    for (size_t i = digits; i < name.size(); ++i) {
        value = value * 10 + static_cast<uint64_t>(name[i] - '0');
        if (value > UINT32_MAX) {
            return false;
        }
    }
    *number = static_cast<uint32_t>(value);
    *baseLength = digits - kLineSuffix.size();
    return true;
}

// Builds a document line by line.
class Parser {
  public:
    Parser(uint32_t readFlags, IniDocument& document) : flags_(readFlags), document_(document) {}

    void Line(std::string_view line, uint32_t number) {
        size_t start = 0;
        while (start < line.size() && IsIniSpace(line[start])) {
            ++start;
        }
        std::string_view text = line.substr(start);
        bool parsed = false;
        if (!text.empty() && text[0] == '[') {
            parsed = Header(text.substr(1), number);
        } else if (!text.empty() && text[0] != ';') {
            parsed = KeyLine(text, number);
        }
        if (!parsed && (flags_ & kIniReadKeepComments) != 0) {
            pending_.emplace_back(line);
        }
    }

    void Finish() {
        document_.trailingComments = std::move(pending_);
        for (size_t i = 0; i < document_.SectionCount(); ++i) {
            JoinLineKeys(document_.SectionAt(i));
        }
    }

  private:
    bool Header(std::string_view rest, uint32_t number) {
        size_t close = rest.find(']');
        if (close == std::string_view::npos) {
            return false;
        }
        std::string_view name = TrimIniSpace(rest.substr(0, close));
        if (name.empty()) {
            return false;
        }
        IniSection* section = document_.UniqueNames() ? document_.FindSection(name) : nullptr;
        if (section == nullptr) {
            section = &document_.AddSection(name, false);
            section->line = number;
        }
        TakeComments(section->comments);
        current_ = section;
        return true;
    }

    bool KeyLine(std::string_view text, uint32_t number) {
        bool colons = (flags_ & kIniReadColonsAndUnnamedSection) != 0;
        size_t separator = text.find_first_of(colons ? std::string_view("=:", 2) : "=");
        if (separator == std::string_view::npos) {
            return false;
        }
        size_t valueStart = separator + 1;
        if (text[separator] == ':' && valueStart < text.size() && text[valueStart] == '=') {
            ++valueStart;
        }
        std::string_view name = TrimIniSpace(text.substr(0, separator));
        std::string_view value = TrimIniSpace(text.substr(valueStart));
        if (name.empty() || (value.empty() && (flags_ & kIniReadKeepEmptyValues) == 0)) {
            return false;
        }
        if (current_ == nullptr) {
            if (!colons) {
                return false;
            }
            current_ = &document_.ObtainSection(nullptr);
        }
        IniKey& key = document_.ObtainKey(*current_, name);
        StoreValue(key, value);
        key.line = number;
        TakeComments(key.comments);
        return true;
    }

    void StoreValue(IniKey& key, std::string_view value) const {
        char quote = 0;
        if (value.size() >= 2) {
            if ((flags_ & kIniReadStripDoubleQuotes) != 0 && value.front() == '"' &&
                value.back() == '"') {
                quote = '"';
            } else if ((flags_ & kIniReadStripApostrophes) != 0 && value.front() == '\'' &&
                       value.back() == '\'') {
                quote = '\'';
            }
        }
        if (quote != 0) {
            value = value.substr(1, value.size() - 2);
        }
        key.value.assign(value.data(), value.size());
        key.quote = quote;
    }

    void TakeComments(std::vector<std::string>& owner) {
        if (pending_.empty()) {
            return;
        }
        owner.insert(owner.end(), std::make_move_iterator(pending_.begin()),
                     std::make_move_iterator(pending_.end()));
        pending_.clear();
    }

    // Joins each run of keys "x Line1", "x Line2", ... into one key "x".
    void JoinLineKeys(IniSection& section) const {
        uint32_t number = 0;
        size_t baseLength = 0;
        bool anyRun = false;
        for (size_t i = 0; i < section.keys.Size() && !anyRun; ++i) {
            anyRun = LineNumber(section.keys.At(i).name, &number, &baseLength) && number == 1;
        }
        if (!anyRun) {
            return;
        }
        std::vector<std::unique_ptr<IniKey>> keys = section.keys.Release();
        std::vector<std::unique_ptr<IniKey>> joined;
        joined.reserve(keys.size());
        for (size_t i = 0; i < keys.size();) {
            std::unique_ptr<IniKey> first = std::move(keys[i++]);
            if (LineNumber(first->name, &number, &baseLength) && number == 1) {
                first->name = std::string(TrimIniSpace(first->name.substr(0, baseLength)));
                size_t ignored = 0;
                while (i < keys.size() && LineNumber(keys[i]->name, &number, &ignored) &&
                       number != 1) {
                    first->value += keys[i]->value;
                    first->comments.insert(first->comments.end(),
                                           std::make_move_iterator(keys[i]->comments.begin()),
                                           std::make_move_iterator(keys[i]->comments.end()));
                    ++i;
                }
            }
            joined.push_back(std::move(first));
        }
        if (document_.UniqueNames()) {
            joined = MergeRepeatedNames(std::move(joined));
        }
        document_.ResetKeys(section, std::move(joined));
    }

    // Under unique names a joined run may take the name of another key. As with a repeated key
    // line, the first key of the name stays in place with the later value, quote mark and line,
    // and gains the later key's comments.
    std::vector<std::unique_ptr<IniKey>> MergeRepeatedNames(
        std::vector<std::unique_ptr<IniKey>> keys) const {
        NameRules rules(document_.CaseSensitive());
        std::unordered_map<std::string_view, IniKey*, NameRules, NameRules> firstOfName(
            keys.size(), rules, rules);
        std::vector<std::unique_ptr<IniKey>> merged;
        merged.reserve(keys.size());
        for (std::unique_ptr<IniKey>& key : keys) {
            auto found = firstOfName.find(key->name);
            if (found == firstOfName.end()) {
                firstOfName.emplace(key->name, key.get());
                merged.push_back(std::move(key));
                continue;
            }
            IniKey& first = *found->second;
            first.value = std::move(key->value);
            first.quote = key->quote;
            first.line = key->line;
            first.comments.insert(first.comments.end(),
                                  std::make_move_iterator(key->comments.begin()),
                                  std::make_move_iterator(key->comments.end()));
        }
        return merged;
    }

    uint32_t flags_;
    IniDocument& document_;
    IniSection* current_ = nullptr;
    std::vector<std::string> pending_;
};

}  // namespace

bool IsPieceName(std::string_view keyName) {
    uint32_t number = 0;
    size_t baseLength = 0;
    return LineNumber(keyName, &number, &baseLength);
}

void ParseIni(std::string_view text, uint32_t readFlags, IniDocument& document) {
    Parser parser(readFlags, document);
    uint32_t number = 1;
    size_t position = 0;
    while (position < text.size()) {
        size_t end = position;
        while (end < text.size() && !IsLineEnd(text[end])) {
            ++end;
        }
        parser.Line(text.substr(position, end - position), number++);
        position = end + 1;
        if (end + 1 < text.size() && text[end] != '\0' && IsLineEnd(text[end + 1]) &&
            text[end + 1] != '\0' && text[end + 1] != text[end]) {
            ++position;
        }
    }
    parser.Finish();
}

int TextStart(std::string_view bytes) {
    auto startsWith = [bytes](std::string_view mark) {
        return bytes.substr(0, mark.size()) == mark;
    };
    using std::string_view_literals::operator""sv;
    if (startsWith("\xFF\xFE\x00\x00"sv) || startsWith("\x00\x00\xFE\xFF"sv) ||
        startsWith("\xFF\xFE"sv) || startsWith("\xFE\xFF"sv)) {
        return kIniUnsupportedEncoding;
    }
    return startsWith("\xEF\xBB\xBF"sv) ? 3 : 0;
}

int ReadIniFile(const char* path, uint32_t readFlags, IniDocument& document, FileStamp* stamp) {
    if (path == nullptr || *path == '\0') {
        return kIniInvalidArgument;
    }
    int descriptor;
    do {
        descriptor = open(path, O_RDONLY | O_CLOEXEC | O_NONBLOCK | O_NOCTTY);
    } while (descriptor < 0 && errno == EINTR);
    const kest::FileDescriptor file(descriptor);
    if (!file.IsOpen()) {
        struct stat status;
        return stat(path, &status) == 0 ? kIniCannotOpenForReading : kIniInvalidArgument;
    }
    struct stat status;
    if (fstat(file.Get(), &status) != 0) {
        return kIniReadError;
    }
    if (!S_ISREG(status.st_mode)) {
        return kIniCannotOpenForReading;
    }
    // Sized by the file, so that loading costs no read beyond its end.
    std::string bytes;
    if (!kest::ReadToEnd(file.Get(), bytes, static_cast<size_t>(status.st_size))) {
        return kIniReadError;
    }
    std::string_view text(bytes);
    int start = TextStart(text);
    if (start < 0) {
        return start;
    }
    ParseIni(text.substr(static_cast<size_t>(start)), readFlags, document);
    *stamp = FileStamp::Of(status);
    return 0;
}

}  // namespace kest::ini
