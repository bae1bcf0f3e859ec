// The plug-in's own settings file "vqkest.ini": the web-service switch (section WebService, key
// Enable). The file is loaded once at construction and written at every change.
#pragma once

#include "config/IniTextPtr.h"

namespace nVQKESTSYSAPICHASSISEXPERT100 {

class KestConfigIni {
  public:
    // Loads the settings file; a missing or unreadable file leaves the settings empty. Throws
    // E_OUTOFMEMORY (a long) when no document can be created.
    KestConfigIni();
    virtual ~KestConfigIni();
    KestConfigIni(const KestConfigIni&) = delete;
    KestConfigIni& operator=(const KestConfigIni&) = delete;

    // True when the switch is present and not 0; as loaded or as last set.
    bool IsWebServiceEnabled() const;
    // Stores the switch as 1 or 0 and saves the file by safe replacement, flushed to the disk.
    // A failure throws E_FAIL (a long) and leaves the settings as the file now holds them.
    void SetWebServiceEnabled(bool enabled);

  private:
    // A new document holding the settings file's content (empty when it cannot be read).
    static IniTextPtr LoadSettings();

    IniTextPtr settings_;
};

}  // namespace nVQKESTSYSAPICHASSISEXPERT100
