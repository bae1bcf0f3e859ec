#include "StateDocument.h"

#include <cctype>

namespace kest::sim {
namespace {

std::string Trim(const std::string& text) {
    const size_t first = text.find_first_not_of(" \t");
    if (first == std::string::npos) {
        return std::string();
    }
    const size_t last = text.find_last_not_of(" \t");
    return text.substr(first, last - first + 1);
}

std::string EntryLine(const std::string& key, const std::string& value) {
    return key + "=" + EscapeIniValue(value);
}

}  // namespace

bool EqualsIgnoringCase(const std::string& a, const std::string& b) {
    if (a.size() != b.size()) {
        return false;
    }
    for (size_t i = 0; i < a.size(); ++i) {
        if (std::tolower(static_cast<unsigned char>(a[i])) !=
            std::tolower(static_cast<unsigned char>(b[i]))) {
            return false;
        }
    }
    return true;
}

std::string EscapeIniValue(const std::string& value) {
    std::string out;
    for (size_t i = 0; i < value.size(); ++i) {
        const char c = value[i];
        switch (c) {
            case '\\':
                out += "\\\\";
                break;
            case '\n':
                out += "\\n";
                break;
            case '\r':
                out += "\\r";
                break;
            case '\t':
                out += "\\t";
                break;
            case ' ':
                out += (i == 0 || i + 1 == value.size()) ? "\\s" : " ";
                break;
            default:
                out += c;
                break;
        }
    }
    return out;
}

std::string UnescapeIniValue(const std::string& text) {
    std::string out;
    for (size_t i = 0; i < text.size(); ++i) {
        if (text[i] != '\\' || i + 1 == text.size()) {
            out += text[i];
            continue;
        }
        const char next = text[i + 1];
        switch (next) {
            case '\\':
                out += '\\';
                break;
            case 'n':
                out += '\n';
                break;
            case 'r':
                out += '\r';
                break;
            case 't':
                out += '\t';
                break;
            case 's':
                out += ' ';
                break;
            default:
                out += '\\';
                out += next;
                break;
        }
        ++i;
    }
    return out;
}

StateDocument StateDocument::Parse(const std::string& text) {
    StateDocument document;
    size_t start = text.compare(0, 3, "\xEF\xBB\xBF") == 0 ? 3 : 0;
    while (start < text.size()) {
        size_t end = text.find('\n', start);
        if (end == std::string::npos) {
            end = text.size();
        }
        std::string raw = text.substr(start, end - start);
        start = end + 1;
        if (!raw.empty() && raw.back() == '\r') {
            raw.pop_back();
        }
        const std::string trimmed = Trim(raw);
        if (trimmed.size() >= 2 && trimmed.front() == '[' && trimmed.back() == ']') {
            Section section;
            section.name = Trim(trimmed.substr(1, trimmed.size() - 2));
            section.headerRaw = raw;
            document.sections_.push_back(std::move(section));
            continue;
        }
        Line line;
        line.raw = raw;
        const size_t equals = trimmed.find('=');
        const bool isComment = !trimmed.empty() && (trimmed[0] == ';' || trimmed[0] == '#');
        if (!isComment && equals != std::string::npos && equals > 0) {
            line.isEntry = true;
            line.key = Trim(trimmed.substr(0, equals));
            line.value = UnescapeIniValue(Trim(trimmed.substr(equals + 1)));
        }
        document.sections_.back().lines.push_back(std::move(line));
    }
    return document;
}

size_t StateDocument::FindSection(const std::string& name) const {
    for (size_t i = 1; i < sections_.size(); ++i) {
        if (EqualsIgnoringCase(sections_[i].name, name)) {
            return i;
        }
    }
    return 0;
}

const std::string* StateDocument::Find(const std::string& section, const std::string& key) const {
    const size_t found = FindSection(section);
    if (found == 0) {
        return nullptr;
    }
    for (const Line& line : sections_[found].lines) {
        if (line.isEntry && EqualsIgnoringCase(line.key, key)) {
            return &line.value;
        }
    }
    return nullptr;
}

void StateDocument::Set(const std::string& section, const std::string& key,
                        const std::string& value) {
    size_t found = FindSection(section);
    if (found == 0) {
        const Section& last = sections_.back();
        const bool endsWithBlank =
            last.lines.empty() ? sections_.size() == 1 : Trim(last.lines.back().raw).empty();
        if (!endsWithBlank) {
            sections_.back().lines.push_back(Line{});
        }
        Section added;
        added.name = section;
        added.headerRaw = "[" + section + "]";
        sections_.push_back(std::move(added));
        found = sections_.size() - 1;
    }
    Section* target = &sections_[found];
    size_t insertAt = 0;
    for (size_t i = 0; i < target->lines.size(); ++i) {
        Line& line = target->lines[i];
        if (!line.isEntry) {
            continue;
        }
        if (EqualsIgnoringCase(line.key, key)) {
            line.value = value;
            line.raw = EntryLine(line.key, value);
            return;
        }
        insertAt = i + 1;
    }
    Line entry;
    entry.isEntry = true;
    entry.key = key;
    entry.value = value;
    entry.raw = EntryLine(key, value);
    target->lines.insert(target->lines.begin() + static_cast<std::ptrdiff_t>(insertAt),
                         std::move(entry));
}

std::vector<std::string> StateDocument::SectionNames() const {
    std::vector<std::string> names;
    for (size_t i = 1; i < sections_.size(); ++i) {
        names.push_back(sections_[i].name);
    }
    return names;
}

std::vector<std::pair<std::string, std::string>> StateDocument::Entries(
    const std::string& section) const {
    std::vector<std::pair<std::string, std::string>> entries;
    if (const size_t found = FindSection(section)) {
        for (const Line& line : sections_[found].lines) {
            if (line.isEntry) {
                entries.emplace_back(line.key, line.value);
            }
        }
    }
    return entries;
}

std::string StateDocument::Serialize() const {
    std::string text;
    for (size_t i = 0; i < sections_.size(); ++i) {
        if (i > 0) {
            text += sections_[i].headerRaw + "\n";
        }
        for (const Line& line : sections_[i].lines) {
            text += line.raw + "\n";
        }
    }
    return text;
}

}  // namespace kest::sim
