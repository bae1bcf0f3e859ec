// The content of one INI document: sections in file order, each with its keys in file order, and
// the comment lines kept with them. Names are looked up through hash indexes.
// Thread safety: no lock of its own; only the IniText that holds it touches it, under that
// document's rule that calls do not overlap.
#pragma once

#include <cstdint>
#include <memory>
#include <string>
#include <string_view>
#include <vector>

#include "config/IniNames.h"
#include "config/NamedList.h"

namespace kest::ini {

struct IniKey {
    std::string name;
    std::string value;                  // without surrounding whitespace
    char quote = 0;                     // 0, '"' or '\'': the writer encloses the value in it
    uint32_t line = 0;                  // line of the file it came from (0: set by a caller)
    std::vector<std::string> comments;  // comment lines that stood before it
};

struct IniSection {
    explicit IniSection(NameRules rules) : keys(rules) {}

    std::string name;
    bool unnamed = false;  // holds keys found before the first header; written without header
    uint32_t line = 0;     // line of its header (0: created by a caller)
    std::vector<std::string> comments;
    NamedList<IniKey> keys;
};

class IniDocument {
  public:
    IniDocument() = default;
    IniDocument(bool uniqueNames, bool caseSensitive);

    bool UniqueNames() const { return uniqueNames_; }
    bool CaseSensitive() const { return rules_.CaseSensitive(); }
    // Changes the name rules and re-indexes the current content.
    void SetNameOptions(bool uniqueNames, bool caseSensitive);

    size_t SectionCount() const { return sections_.Size(); }
    IniSection& SectionAt(size_t position) const { return sections_.At(position); }

    // The section of that name (null name: the unnamed section), or null.
    IniSection* FindSection(const char* name) const;
    IniSection* FindSection(std::string_view name) const { return sections_.Find(name); }
    IniKey* FindKey(const char* section, const char* key) const;

    // A new section at the end (the unnamed one always goes first).
    IniSection& AddSection(std::string_view name, bool unnamed);
    // The existing section of that name when names are unique, otherwise a new one.
    IniSection& ObtainSection(const char* name);
    // The existing key of that name when names are unique, otherwise a new one at the end.
    IniKey& ObtainKey(IniSection& section, std::string_view name);

    // Removes a key; its comments go to the following key, section or the trailing comments.
    bool DeleteKey(const char* section, const char* key);
    bool DeleteSection(const char* section);

    // Replaces the keys of `section`, re-indexing them.
    void ResetKeys(IniSection& section, std::vector<std::unique_ptr<IniKey>> keys) const;

    std::vector<std::string> trailingComments;

  private:
    bool uniqueNames_ = true;
    NameRules rules_;
    NamedList<IniSection> sections_;
};

}  // namespace kest::ini
