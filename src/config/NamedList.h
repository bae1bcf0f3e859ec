// An ordered list of named entries that finds the first entry of a name by its hash. Short lists
// compare the hashes kept beside the entries in order; once a list holds more than kIndexedFrom
// entries a hash index from name to first entry takes over, so lookups cost one hash probe however
// long the list grows. Most sections hold a handful of keys: they need no index nodes, which keeps
// loading large files lean. Entries live on the heap, so their addresses (and the names the index
// points into) stay put while the list changes.
// Thread safety: no lock of its own; a list is used by one thread at a time, under its document's
// rule.
#pragma once

#include <cstddef>
#include <memory>
#include <string_view>
#include <unordered_map>
#include <utility>
#include <vector>

#include "config/IniNames.h"

namespace kest::ini {

// `Entry` must have a std::string member `name`.
template <class Entry>
class NamedList {
  public:
    // Lists longer than this are indexed.
    static constexpr size_t kIndexedFrom = 16;

    explicit NamedList(NameRules rules = NameRules()) : rules_(rules), index_(0, rules, rules) {}

    size_t Size() const { return entries_.size(); }
    Entry& At(size_t position) const { return *entries_[position]; }

    // The first entry named `name`, or null.
    Entry* Find(std::string_view name) const {
        if (!Indexed()) {
            const size_t hash = rules_(name);
            for (size_t i = 0; i < entries_.size(); ++i) {
                if (hashes_[i] == hash && rules_(entries_[i]->name, name)) {
                    return entries_[i].get();
                }
            }
            return nullptr;
        }
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
        hashes_.push_back(rules_(added.name));
        try {
            entries_.push_back(std::move(entry));
        } catch (...) {
            hashes_.pop_back();
            throw;
        }
        if (Indexed()) {
            index_.emplace(added.name, &added);
        } else if (entries_.size() > kIndexedFrom) {
            RebuildIndex();
        }
        return added;
    }

    // Inserts before every other entry; it becomes the first of its name.
    Entry& Prepend(std::unique_ptr<Entry> entry) {
        Entry& added = *entry;
        hashes_.insert(hashes_.begin(), rules_(added.name));
        try {
            entries_.insert(entries_.begin(), std::move(entry));
        } catch (...) {
            hashes_.erase(hashes_.begin());
            throw;
        }
        if (Indexed()) {
            index_.insert_or_assign(added.name, &added);
        } else if (entries_.size() > kIndexedFrom) {
            RebuildIndex();
        }
        return added;
    }

    // Removes and returns the entry at `position`; the next entry of that name, if any, takes
    // its place in the index.
    std::unique_ptr<Entry> Remove(size_t position) {
        std::unique_ptr<Entry> removed = std::move(entries_[position]);
        entries_.erase(entries_.begin() + static_cast<std::ptrdiff_t>(position));
        hashes_.erase(hashes_.begin() + static_cast<std::ptrdiff_t>(position));
        if (!Indexed()) {
            return removed;
        }
        auto indexed = index_.find(removed->name);
        if (indexed != index_.end() && indexed->second == removed.get()) {
            index_.erase(indexed);
            for (const auto& entry : entries_) {
                if (rules_(entry->name, removed->name)) {
                    index_.emplace(entry->name, entry.get());
                    break;
                }
            }
        }
        return removed;
    }

    // Replaces all entries at once and rebuilds the index under `rules`.
    void Reset(std::vector<std::unique_ptr<Entry>> entries, NameRules rules) {
        std::vector<size_t> hashes(entries.size());
        for (size_t i = 0; i < entries.size(); ++i) {
            hashes[i] = rules(entries[i]->name);
        }
        entries_ = std::move(entries);
        hashes_ = std::move(hashes);
        rules_ = rules;
        index_ = Index(0, rules_, rules_);
        if (entries_.size() > kIndexedFrom) {
            RebuildIndex();
        }
    }

    // Hands the entries out (leaving the list empty), for a caller that rebuilds them.
    std::vector<std::unique_ptr<Entry>> Release() {
        index_.clear();
        hashes_.clear();
        return std::exchange(entries_, {});
    }

  private:
    using Index = std::unordered_map<std::string_view, Entry*, NameRules, NameRules>;

    // An index exists once it has entries: a list only ever loses it by Reset or Release.
    bool Indexed() const { return !index_.empty(); }

    // Indexes every name under its first entry. Built aside, so that a failure leaves the list
    // unindexed, which the ordered search serves just as well.
    void RebuildIndex() {
        Index fresh(entries_.size(), rules_, rules_);
        for (const auto& entry : entries_) {
            fresh.emplace(entry->name, entry.get());
        }
        index_ = std::move(fresh);
    }

    std::vector<std::unique_ptr<Entry>> entries_;
    std::vector<size_t> hashes_;  // the hash of each entry's name, in list order
    NameRules rules_;
    Index index_;
};

}  // namespace kest::ini
