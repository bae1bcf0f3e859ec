// Owning handle of an IniText document: destroys it with IniText_Destroy.
// Thread safety: as for the document it owns (see IniText.h).
#pragma once

#include <memory>

#include "config/IniText.h"

struct IniTextDeleter {
    void operator()(IniText* ini) const { IniText_Destroy(ini); }
};

using IniTextPtr = std::unique_ptr<IniText, IniTextDeleter>;
