#include "config/IniFileManager.h"

#include <sys/stat.h>

#include "support/Exceptions.h"
#include "support/PathHelpers.h"
#include "support/Sleep.h"
#include "support/TraceGate.h"
#include "uxsys/StatusCodes.h"

namespace {

// Cached documents keep empty values and lose the double quotes around values.
constexpr uint32_t kCacheReadFlags = kIniReadKeepEmptyValues | kIniReadStripDoubleQuotes;
// Saves replace the file through a new temporary named after it ("name.TMP" and six random
// characters), write " = " and reach the disk, directory included.
constexpr uint32_t kCacheWriteFlags =
    kIniWriteSafeReplacement | kIniWriteSpacedSeparator | kIniWriteSync;
constexpr mode_t kNewFileMode = 0664;

std::weak_ptr<IniFileManager>& InstanceSlot() {
    static std::weak_ptr<IniFileManager> instance;
    return instance;
}

// Saves one cached document by safe replacement; a file new on disk gets mode 0664.
bool Save(const std::string& path, IniText* text) {
    IniText_SetWriteOptions(text, kIniNoMaxLineLength, kIniNoSplitCharacter, kCacheWriteFlags);
    bool existed = false;
    try {
        existed = vq::dsc::osdep::IsRegularFile(path);
    } catch (const vq::dsc::exception::Exception&) {
        // A relative path, or one that cannot be examined, cannot be saved either.
        return false;
    }
    if (IniText_Save(text, path.c_str()) < 0) {
        return false;
    }
    return existed || chmod(path.c_str(), kNewFileMode) == 0;
}

}  // namespace

vq::dsc::Mutex& IniFileManager::CacheLock() {
    static vq::dsc::Mutex lock;
    return lock;
}

std::shared_ptr<IniFileManager> IniFileManager::GetInstance() {
    vq::dsc::ScopedLock lock(CacheLock());
    std::shared_ptr<IniFileManager> instance = InstanceSlot().lock();
    if (!instance) {
        instance = std::make_shared<IniFileManager>(ConstructionKey());
        InstanceSlot() = instance;
    }
    return instance;
}

IniFileManager::IniCacheEntry& IniFileManager::Entry(const std::string& path) {
    auto found = entries_.find(path);
    if (found != entries_.end()) {
        IniCacheEntry& entry = found->second;
        // A failed re-load keeps the old content.
        if (!entry.modified && IniText_HasFileChanged(entry.text.get()) != 0) {
            IniText_Load(entry.text.get(), path.c_str());
        }
        return entry;
    }
    IniTextPtr text(IniText_Create());
    if (!text) {
        if (IsTraceEnabled(kTraceIniCache)) {
            TraceIfEnabled("GetIniCacheEntry - failed to create new IniText(" + path + ")",
                           kTraceIniCache);
        }
        throw static_cast<long>(E_OUTOFMEMORY);
    }
    IniText_SetReadOptions(text.get(), kCacheReadFlags);
    // A missing or unreadable file leaves the document empty; it is cached all the same.
    IniText_Load(text.get(), path.c_str());
    return entries_.emplace(path, IniCacheEntry{std::move(text), false}).first->second;
}

IniText* IniFileManager::GetIniCacheEntry(const std::string& path) {
    return Entry(path).text.get();
}

HRESULT IniFileManager::GetStringFromIni(const std::string& path, const std::string& section,
                                         const std::string& key, std::string& value) {
    try {
        vq::dsc::ScopedLock lock(CacheLock());
        const char* found = nullptr;
        if (IniText_GetString(GetIniCacheEntry(path), section.c_str(), key.c_str(), &found) !=
            kIniFound) {
            return S_FALSE;
        }
        value = found;
        return S_OK;
    } catch (long status) {
        TraceStatus("GetStringFromIni failed", static_cast<HRESULT>(status));
        return static_cast<HRESULT>(status);
    }
}

HRESULT IniFileManager::SetStringInIni(const std::string& path, const std::string& section,
                                       const std::string& key, const std::string& value) {
    try {
        vq::dsc::ScopedLock lock(CacheLock());
        IniCacheEntry& entry = Entry(path);
        int result =
            IniText_SetString(entry.text.get(), section.c_str(), key.c_str(), value.c_str(), false);
        if (result == kIniOutOfMemory) {
            return E_OUTOFMEMORY;
        }
        if (result < 0) {
            return E_INVALIDARG;
        }
        entry.modified = true;
        return S_OK;
    } catch (long status) {
        return static_cast<HRESULT>(status);
    }
}

HRESULT IniFileManager::FlushIniCache() {
    vq::dsc::ScopedLock lock(CacheLock());
    bool saved = false;
    for (auto& [path, entry] : entries_) {
        if (!entry.modified) {
            continue;
        }
        if (!saved) {
            vq::dsc::osdep::SleepMs(1);
        }
        if (!Save(path, entry.text.get())) {
            return E_FAIL;
        }
        entry.modified = false;
        saved = true;
    }
    if (saved) {
        vq::dsc::osdep::SleepMs(1);
    }
    return saved ? S_OK : S_FALSE;
}
