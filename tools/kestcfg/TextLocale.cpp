#include "TextLocale.h"

#include <langinfo.h>
#include <strings.h>

#include <clocale>
#include <initializer_list>

namespace kest::cfg {

namespace {

bool IsUtf8Locale() {
    const char* codeset = nl_langinfo(CODESET);
    return codeset != nullptr &&
           (strcasecmp(codeset, "UTF-8") == 0 || strcasecmp(codeset, "utf8") == 0);
}

}  // namespace

void UseTextLocale() {
    if (std::setlocale(LC_CTYPE, "") != nullptr && IsUtf8Locale()) {
        return;
    }
    for (const char* name : {"C.UTF-8", "C.utf8", "en_US.UTF-8"}) {
        if (std::setlocale(LC_CTYPE, name) != nullptr && IsUtf8Locale()) {
            return;
        }
    }
}

}  // namespace kest::cfg
