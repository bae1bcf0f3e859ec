// An ordered list of named entries with a hash index from name to the first entry of that name,
// so lookups cost one hash probe however long the list is. Entries live on the heap, so their
// addresses (and the names the index points into) stay put while the list changes.
#pragma once

#include <cstddef>
#include <memory>
#include <string_view>
#include <unordered_map>
#include <utility>
#include <vector>

#include "config/IniNames.h"

namespace kest_ini {

// `Entry` must have a std::string member `name`.
template <class Entry>
class NamedList {
  public:
    explicit NamedList(NameRules rules = NameRules()) : index_(0, rules, rules) {}

    size_t Size() const { return entries_.size(); }
    Entry& At(size_t position) const { return *entries_[position]; }

    // The first entry named `name`, or null.
    Entry* Find(std::string_view name) const {
        auto found = index_.find(name);
        return found == index_.end() ? nullptr : found->second;
    }

    // Position of `entry` in the list (it must be in the list).
    size_t PositionOf(const Entry* entry) const {
        size_t position = 0;
        while (entries_[position].get() != entry) {
            ++position;
        }
        return position;
    }

    Entry& Append(std::unique_ptr<Entry> entry) {
        Entry& added = *entry;
        entries_.push_back(std::move(entry));
        index_.emplace(added.name, &added);
        return added;
    }

    // Inserts before every other entry; it becomes the first of its name.
    Entry& Prepend(std::unique_ptr<Entry> entry) {
        Entry& added = *entry;
        entries_.insert(entries_.begin(), std::move(entry));
        index_.insert_or_assign(added.name, &added);
        return added;
    }

    // Removes and returns the entry at `position`; the next entry of that name, if any, takes
    // its place in the index.
    std::unique_ptr<Entry> Remove(size_t position) {
        std::unique_ptr<Entry> removed = std::move(entries_[position]);
        entries_.erase(entries_.begin() + static_cast<std::ptrdiff_t>(position));
        auto indexed = index_.find(removed->name);
        if (indexed != index_.end() && indexed->second == removed.get()) {
            index_.erase(indexed);
            for (const auto& entry : entries_) {
                if (index_.key_eq()(entry->name, removed->name)) {
                    index_.emplace(entry->name, entry.get());
                    break;
                }
            }
        }
        return removed;
    }

    // Replaces all entries at once and rebuilds the index under `rules`.
    void Reset(std::vector<std::unique_ptr<Entry>> entries, NameRules rules) {
        entries_ = std::move(entries);
        Index fresh(entries_.size(), rules, rules);
        for (const auto& entry : entries_) {
            fresh.emplace(entry->name, entry.get());
        }
        index_ = std::move(fresh);
    }

    // Hands the entries out (leaving the list empty), for a caller that rebuilds them.
    std::vector<std::unique_ptr<Entry>> Release() {
        index_.clear();
        return std::exchange(entries_, {});
    }

  private:
    using Index = std::unordered_map<std::string_view, Entry*, NameRules, NameRules>;

    std::vector<std::unique_ptr<Entry>> entries_;
    Index index_;
};

}  // namespace kest_ini
