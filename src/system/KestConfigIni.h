// The plug-in's own settings file "vqkest.ini": the web-service switch (section WebService, key
// Enable). The file is read again whenever it changed on disk, so other processes' saves are
// seen, and every save changes the file as it is at that moment.
#pragma once

#include "config/IniTextPtr.h"

namespace nVQKESTSYSAPICHASSISEXPERT100 {

// Thread safety: not for concurrent calls; its owner calls it under its mutex. Saves of all
// processes take turns on the lock file beside the settings file.
class KestConfigIni {
  public:
    // Loads the settings file; a missing or unreadable file leaves the settings empty. Throws
    // E_OUTOFMEMORY (a long) when no document can be created.
    KestConfigIni();
    virtual ~KestConfigIni();
    KestConfigIni(const KestConfigIni&) = delete;
    KestConfigIni& operator=(const KestConfigIni&) = delete;

    // True when the switch is present and not 0 in the file as it is now (re-loaded when it
    // changed; a file that cannot be read keeps the last settings read, a missing one reads as
    // disabled).
    bool IsWebServiceEnabled();
    // Stores the switch as 1 or 0 into the file as it is now, keeping the rest of it, and saves
    // it by safe replacement, flushed to the disk. Saves of all processes take turns on a lock
    // file beside it. A failure, including a file that exists but cannot be read (left
    // unchanged), throws E_FAIL (a long) and leaves the settings as the file now holds them.
    void SetWebServiceEnabled(bool enabled);

  private:
    // A new empty document with the settings file's write options.
    static IniTextPtr NewDocument();
    // Loads the settings file into a new document: 0 or, when it exists but cannot be read,
    // the engine failure; a missing file gives an empty document.
    static int LoadSettings(IniTextPtr& settings);

    IniTextPtr settings_;
};

}  // namespace nVQKESTSYSAPICHASSISEXPERT100
