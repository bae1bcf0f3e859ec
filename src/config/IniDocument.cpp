#include "config/IniDocument.h"

#include <utility>

#include "config/IniText.h"

namespace kest::ini {

IniDocument::IniDocument(bool uniqueNames, bool caseSensitive)
    : uniqueNames_(uniqueNames), rules_(caseSensitive), sections_(rules_) {}

void IniDocument::SetNameOptions(bool uniqueNames, bool caseSensitive) {
    uniqueNames_ = uniqueNames;
    rules_ = NameRules(caseSensitive);
    sections_.Reset(sections_.Release(), rules_);
    for (size_t i = 0; i < sections_.Size(); ++i) {
        IniSection& section = sections_.At(i);
        section.keys.Reset(section.keys.Release(), rules_);
    }
}

IniSection* IniDocument::FindSection(const char* name) const {
    if (name == nullptr) {
        if (sections_.Size() > 0 && sections_.At(0).unnamed) {
            return &sections_.At(0);
        }
        return nullptr;
    }
    return sections_.Find(name);
}

IniKey* IniDocument::FindKey(const char* section, const char* key) const {
    IniSection* found = FindSection(section);
    if (found == nullptr || key == nullptr) {
        return nullptr;
    }
    return found->keys.Find(key);
}

IniSection& IniDocument::AddSection(std::string_view name, bool unnamed) {
    auto section = std::make_unique<IniSection>(rules_);
    section->name = unnamed ? std::string(kIniUnnamedSection) : std::string(name);
    section->unnamed = unnamed;
    return unnamed ? sections_.Prepend(std::move(section)) : sections_.Append(std::move(section));
}

IniSection& IniDocument::ObtainSection(const char* name) {
    if (name == nullptr) {
        IniSection* unnamed = FindSection(name);
        return unnamed != nullptr ? *unnamed : AddSection(kIniUnnamedSection, true);
    }
    std::string_view trimmed = TrimIniSpace(name);
    if (uniqueNames_) {
        if (IniSection* existing = sections_.Find(trimmed)) {
            return *existing;
        }
    }
    return AddSection(trimmed, false);
}

IniKey& IniDocument::ObtainKey(IniSection& section, std::string_view name) {
    if (uniqueNames_) {
        if (IniKey* existing = section.keys.Find(name)) {
            return *existing;
        }
    }
    auto key = std::make_unique<IniKey>();
    key->name = std::string(TrimIniSpace(name));
    return section.keys.Append(std::move(key));
}

bool IniDocument::DeleteKey(const char* section, const char* key) {
    IniSection* owner = FindSection(section);
    if (owner == nullptr || key == nullptr) {
        return false;
    }
    IniKey* found = owner->keys.Find(key);
    if (found == nullptr) {
        return false;
    }
    size_t position = owner->keys.PositionOf(found);
    std::unique_ptr<IniKey> removed = owner->keys.Remove(position);
    if (removed->comments.empty()) {
        return true;
    }
    std::vector<std::string>* heir = &trailingComments;
    if (position < owner->keys.Size()) {
        heir = &owner->keys.At(position).comments;
    } else {
        size_t next = sections_.PositionOf(owner) + 1;
        if (next < sections_.Size()) {
            heir = &sections_.At(next).comments;
        }
    }
    heir->insert(heir->begin(), std::make_move_iterator(removed->comments.begin()),
                 std::make_move_iterator(removed->comments.end()));
    return true;
}

bool IniDocument::DeleteSection(const char* section) {
    IniSection* found = FindSection(section);
    if (found == nullptr) {
        return false;
    }
    sections_.Remove(sections_.PositionOf(found));
    return true;
}

void IniDocument::ResetKeys(IniSection& section, std::vector<std::unique_ptr<IniKey>> keys) const {
    section.keys.Reset(std::move(keys), rules_);
}

}  // namespace kest::ini
