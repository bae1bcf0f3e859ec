// The process-wide INI cache: one parsed document per file path, re-read when the file's
// modification time changes, with all access serialised by one process-wide recursive lock.
// Thread safety: every operation may be called from any thread; CacheLock() guards the cache and
// its documents, and a caller of GetIniCacheEntry holds it for as long as it uses the document.
#pragma once

#include <cstdint>
#include <functional>
#include <map>
#include <memory>
#include <string>

#include "config/IniTextPtr.h"
#include "support/Mutex.h"
#include "uxsys/Types.h"

class IniFileManager {
    struct ConstructionKey {};

  public:
    explicit IniFileManager(ConstructionKey) {}
    IniFileManager(const IniFileManager&) = delete;
    IniFileManager& operator=(const IniFileManager&) = delete;

    // The process-wide cache, created by the first call; it and every cached document live
    // while a reference exists.
    static std::shared_ptr<IniFileManager> GetInstance();

    // The process-wide lock. GetIniCacheEntry and every use of the document it returns must
    // hold it; the other operations take it themselves. It is recursive.
    static vq::dsc::Mutex& CacheLock();

    // The cached document of `path`, loaded on first use (a missing or unreadable file gives an
    // empty document, cached all the same) and re-loaded when the file changed, unless it holds
    // unsaved changes; a failed re-load keeps the content. Throws E_OUTOFMEMORY (a long) when no
    // document can be created.
    IniText* GetIniCacheEntry(const std::string& path);

    // S_OK and `value` set when the key exists, S_FALSE when it does not, or a failure status.
    HRESULT GetStringFromIni(const std::string& path, const std::string& section,
                             const std::string& key, std::string& value);

    // Sets a value (written between double quotes) in the cached document of `path` and marks
    // it modified, so the next FlushIniCache saves it. S_OK, E_INVALIDARG for names or values
    // the file could not hold, or E_OUTOFMEMORY.
    HRESULT SetStringInIni(const std::string& path, const std::string& section,
                           const std::string& key, const std::string& value);

    // Saves every modified document, in path order, by safe replacement; a file that did not
    // exist gets mode 0664. S_OK when at least one file was saved, S_FALSE when nothing was
    // modified, E_FAIL when a save failed or a path is relative (that document stays marked and
    // the documents after it are not saved).
    HRESULT FlushIniCache();

  private:
    struct IniCacheEntry {
        IniTextPtr text;
        bool modified = false;  // holds changes not saved yet: never re-loaded
    };

    IniCacheEntry& Entry(const std::string& path);

    std::map<std::string, IniCacheEntry, std::less<>> entries_;
};
