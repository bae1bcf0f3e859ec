// The INI engine: one parsed INI document (`IniText`) behind a C-style interface. Getters return
// 1 when found, 0 when not found; setters return 1 on success; IniText_Load and IniText_Save
// return 0 on success. Every failure is one of the negative results below.
// Thread safety: calls on one document must not overlap (the INI cache serialises its documents
// with IniFileManager::CacheLock()); distinct documents may be used from different threads at once.
#pragma once

#include <cstddef>
#include <cstdint>

struct IniText;

// Results of the engine.
constexpr int kIniFound = 1;
constexpr int kIniNotFound = 0;
constexpr int kIniNoRoomToSplit = -2;
constexpr int kIniUnsupportedEncoding = -3;
constexpr int kIniEmptyName = -6;
constexpr int kIniOutOfMemory = -12;
constexpr int kIniCannotWriteTarget = -13;
constexpr int kIniInvalidArgument = -22;  // empty path, missing file, line break in a name or value
constexpr int kIniWriteFailed = -28;
constexpr int kIniCannotOpenForReading = -5001;
constexpr int kIniReadError = -5002;
constexpr int kIniCannotCreateTemporary = -5003;
constexpr int kIniCannotOpenOutput = -5004;
constexpr int kIniNotInt32 = -5021;
constexpr int kIniNotUInt32 = -5022;
constexpr int kIniNotDouble = -5023;
constexpr int kIniNotBoolean = -5024;

// Read flags.
constexpr uint32_t kIniReadKeepEmptyValues = 0x01;
constexpr uint32_t kIniReadStripDoubleQuotes = 0x02;
constexpr uint32_t kIniReadStripApostrophes = 0x04;
constexpr uint32_t kIniReadColonsAndUnnamedSection = 0x08;
constexpr uint32_t kIniReadKeepComments = 0x10;

// Write flags.
constexpr uint32_t kIniWriteByteOrderMark = 0x01;
constexpr uint32_t kIniWriteSafeReplacement = 0x02;
constexpr uint32_t kIniWriteUniqueTemporary = 0x04;
constexpr uint32_t kIniWriteSpacedSeparator = 0x08;
constexpr uint32_t kIniWriteComments = 0x10;
constexpr uint32_t kIniWriteSync = 0x20;

constexpr uint32_t kIniDefaultReadFlags = kIniReadStripDoubleQuotes;
// Safe replacement through a uniquely named temporary, " = " between name and value, synced.
constexpr uint32_t kIniDefaultWriteFlags =
    kIniWriteSafeReplacement | kIniWriteUniqueTemporary | kIniWriteSpacedSeparator | kIniWriteSync;
constexpr int kIniDefaultMaxLineLength = 80;
constexpr int kIniNoMaxLineLength = -1;
constexpr int kIniNoSplitCharacter = 0;

// Name of the section that holds keys found before the first header; a null section name given
// to any operation means this section.
constexpr const char* kIniUnnamedSection = "(null)";

// A new empty document with the default options, or null when memory is short.
IniText* IniText_Create();
// Destroys a document made by IniText_Create (null is accepted).
void IniText_Destroy(IniText* ini);

// Read flags used by the next IniText_Load.
void IniText_SetReadOptions(IniText* ini, uint32_t readFlags);
// Maximum line length (<= 0: none), split character (kIniNoSplitCharacter: none; must be
// below 128, else -5021) and write flags used by IniText_Save. Returns 1.
int IniText_SetWriteOptions(IniText* ini, int maxLineLength, int splitCharacter,
                            uint32_t writeFlags);
// Whether repeated names refer to the existing section or key (default true) and whether names
// compare case-sensitively (default false). Applies to the current content too.
void IniText_SetNameOptions(IniText* ini, bool uniqueNames, bool caseSensitive);

// Replaces the content with the file's; on failure the document is left unchanged.
int IniText_Load(IniText* ini, const char* path);
// Writes the document to `path` following the write options.
int IniText_Save(IniText* ini, const char* path);
// 1 when the remembered file is no longer the version of the last load or save (another inode,
// size or modification time to the nanosecond), 0 when it is the same, negative when there is
// no remembered file or it cannot be examined.
int IniText_HasFileChanged(const IniText* ini);

// Pointer to the stored value (valid until the key is changed or the document destroyed).
int IniText_GetString(const IniText* ini, const char* section, const char* key, const char** value);
// Copies the value into `buffer`, cut to `bufferSize - 1` bytes and always terminated.
int IniText_GetStringIntoBuffer(const IniText* ini, const char* section, const char* key,
                                char* buffer, size_t bufferSize);
// A copy of the value allocated with malloc (the caller frees it); -12 when allocation fails.
int IniText_GetStringCopy(const IniText* ini, const char* section, const char* key, char** value);
// The value with backslash escapes decoded; the pointer stays valid until the next call of this
// operation on the same document.
int IniText_GetEscapedString(IniText* ini, const char* section, const char* key,
                             const char** value);
// Numeric and boolean getters: an empty or blank value counts as not found.
int IniText_GetUInt32(const IniText* ini, const char* section, const char* key, uint32_t* value);
int IniText_GetInt32(const IniText* ini, const char* section, const char* key, int32_t* value);
int IniText_GetBoolean(const IniText* ini, const char* section, const char* key, bool* value);
int IniText_GetDouble(const IniText* ini, const char* section, const char* key, double* value);

// Sets a value (surrounding whitespace removed) with its quote mark (0 or '"'), creating the
// section and key when missing. Empty names give -6. What is accepted reads back as given under
// the read flags of the INI cache (kIniReadKeepEmptyValues | kIniReadStripDoubleQuotes, with or
// without kIniReadKeepComments); what would not gives -22: a line break anywhere, ']' in a
// section name, '=' in a key name or a key name starting with '[' or ';', a value enclosed in
// double quotes with quote mark 0 (it would lose them), and any other quote mark (the apostrophe
// would stay part of the value).
int IniText_SetRaw(IniText* ini, const char* section, const char* key, const char* value,
                   char quoteMark);
// Sets a value written between double quotes, with backslash escapes when `escape` is set.
int IniText_SetString(IniText* ini, const char* section, const char* key, const char* value,
                      bool escape);
int IniText_SetUInt32(IniText* ini, const char* section, const char* key, uint32_t value);
int IniText_SetInt32(IniText* ini, const char* section, const char* key, int32_t value);
int IniText_SetDouble(IniText* ini, const char* section, const char* key, double value);
// Removes a key (its comments move to what follows it); 1 when removed, 0 when not found.
int IniText_DeleteKey(IniText* ini, const char* section, const char* key);
// Removes a section with its keys; 1 when removed, 0 when not found.
int IniText_DeleteSection(IniText* ini, const char* section);

// Enumeration with 1-based indexes, in file order.
int IniText_GetSectionCount(const IniText* ini);
int IniText_GetSectionName(const IniText* ini, int index, const char** name);
// Number of keys of a section (0 when the section does not exist).
int IniText_GetKeyCount(const IniText* ini, const char* section);
int IniText_GetKeyByIndex(const IniText* ini, const char* section, int index, const char** key,
                          const char** value);
