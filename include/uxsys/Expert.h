// The expert's interfaces (identity, entry points, plug-and-play, import matching, firmware,
// framework notifications), the host's callback interfaces (search sink, firmware image source)
// and the one function the plug-in exports.
#pragma once

#include <cstdint>

#include "uxsys/Enumerators.h"
#include "uxsys/IUnknown.h"
#include "uxsys/PropertyBag.h"
#include "uxsys/Types.h"

// 960d9d74-596d-4187-b4f4-c0fbed11e6ce (the expert does not answer it)
inline constexpr IID IID_IuxSysExpertInfo = {
    0x960d9d74, 0x596d, 0x4187, {0xb4, 0xf4, 0xc0, 0xfb, 0xed, 0x11, 0xe6, 0xce}};
// 9c257614-172d-4d5d-81bb-3d4f72bd30a4
inline constexpr IID IID_IuxSysExpert = {
    0x9c257614, 0x172d, 0x4d5d, {0x81, 0xbb, 0x3d, 0x4f, 0x72, 0xbd, 0x30, 0xa4}};
// b259235b-6978-4402-8910-e19e1295f326
inline constexpr IID IID_IuxSysExpert2 = {
    0xb259235b, 0x6978, 0x4402, {0x89, 0x10, 0xe1, 0x9e, 0x12, 0x95, 0xf3, 0x26}};
// cf3357ad-3023-4121-a60e-2ff9b3a87bee
inline constexpr IID IID_IuxSysExpert3 = {
    0xcf3357ad, 0x3023, 0x4121, {0xa6, 0x0e, 0x2f, 0xf9, 0xb3, 0xa8, 0x7b, 0xee}};
// c20e7758-0346-431a-a411-bf7c1e736a60
inline constexpr IID IID_IuxSysExpertPlugPlay = {
    0xc20e7758, 0x0346, 0x431a, {0xa4, 0x11, 0xbf, 0x7c, 0x1e, 0x73, 0x6a, 0x60}};
// 74bd14c7-ef0c-4a7c-9135-420dc4b94784 (the expert does not answer it)
inline constexpr IID IID_IuxSysExpertImportExport = {
    0x74bd14c7, 0xef0c, 0x4a7c, {0x91, 0x35, 0x42, 0x0d, 0xc4, 0xb9, 0x47, 0x84}};
// 56493845-09cc-471c-ba01-da8152fb957c
inline constexpr IID IID_IuxSysExpertFirmware = {
    0x56493845, 0x09cc, 0x471c, {0xba, 0x01, 0xda, 0x81, 0x52, 0xfb, 0x95, 0x7c}};
// 768653cd-bf65-4027-b706-0f33eee3689a
inline constexpr IID IID_IuxSysFrameworkNotificationHandler = {
    0x768653cd, 0xbf65, 0x4027, {0xb7, 0x06, 0x0f, 0x33, 0xee, 0xe3, 0x68, 0x9a}};
// c03bc178-ba2b-4eb4-971c-a3de86046d98
inline constexpr IID IID_IuxSysSearchSink = {
    0xc03bc178, 0xba2b, 0x4eb4, {0x97, 0x1c, 0xa3, 0xde, 0x86, 0x04, 0x6d, 0x98}};
// d661e93b-9e36-4433-9136-57726721a384
inline constexpr IID IID_IuxSysFirmwareImageSource = {
    0xd661e93b, 0x9e36, 0x4433, {0x91, 0x36, 0x57, 0x72, 0x67, 0x21, 0xa3, 0x84}};
// 53381f13-0f3d-457b-b73d-f83ce4ab1f16
inline constexpr IID IID_IuxSysFirmwareImageFile = {
    0x53381f13, 0x0f3d, 0x457b, {0xb7, 0x3d, 0xf8, 0x3c, 0xe4, 0xab, 0x1f, 0x16}};

// Firmware update states reported by GetFirmwareUpdateStatus.
constexpr int32_t UX_FIRMWARE_STATE_IDLE = 2;
constexpr int32_t UX_FIRMWARE_STATE_PREPARED = -1;
constexpr int32_t UX_FIRMWARE_STATE_RUNNING = -2;
constexpr int32_t UX_FIRMWARE_STATE_FINISHING = -3;
constexpr int32_t UX_FIRMWARE_STATE_INSTALLED = -4;
constexpr int32_t UX_FIRMWARE_STATE_FAILED = 5;

// Host callback that receives one property bag per item during a search.
class IuxSysSearchSink : public IUnknown {
  public:
    // Slot 3: not used by the expert.
    virtual HRESULT Reserved3() = 0;
    // Slot 4: not used by the expert.
    virtual HRESULT Reserved4() = 0;
    // Slot 5: one item's properties; a negative status ends the search.
    virtual HRESULT OnItemFound(IuxSysPropertyBag* item) = 0;

  protected:
    ~IuxSysSearchSink() = default;
};

// Host object that holds a firmware image in memory.
class IuxSysFirmwareImageSource : public IUnknown {
  public:
    // Slot 3: the number of image bytes.
    virtual uint32_t GetImageSize() = 0;
    // Slot 4: the image bytes (GetImageSize of them), owned by the source.
    virtual const uint8_t* GetImageBytes() = 0;

  protected:
    ~IuxSysFirmwareImageSource() = default;
};

// Host object whose firmware image already lies in a file.
class IuxSysFirmwareImageFile : public IuxSysFirmwareImageSource {
  public:
    // Slot 5: the image file's path as a new host string the caller frees.
    virtual HRESULT GetImageFilePath(CvqBStr* path) = 0;

  protected:
    ~IuxSysFirmwareImageFile() = default;
};

// The expert's identity. String results are new host strings the caller frees.
class IuxSysExpertInfo : public IUnknown {
  public:
    // Slot 3: the expert's class identifier.
    virtual HRESULT GetExpertClassId(GUID* classId) = 0;
    // Slot 4: the name shown to users.
    virtual HRESULT GetExpertDisplayName(CvqBStr* name) = 0;
    // Slot 5: the expert's version.
    virtual HRESULT GetExpertVersion(CvqBStr* version) = 0;
    // Slot 6: the programmatic name of the configuration framework the expert belongs to.
    virtual HRESULT GetExpertProgrammaticName(CvqBStr* name) = 0;

  protected:
    ~IuxSysExpertInfo() = default;
};

// The entry points with which the host drives the expert.
class IuxSysExpert : public IuxSysExpertInfo {
  public:
    // Slot 7: prepares the expert (diagnostics included); call before anything else.
    virtual HRESULT Initialize() = 0;
    // Slot 8: releases what Initialize and later calls set up.
    virtual HRESULT Uninitialize() = 0;
    // Slot 9: hands each item's property bag to the sink; S_FALSE when no item reached it.
    virtual HRESULT SearchForItemsAndProperties(IuxSysSearchSink* sink) = 0;
    // Slot 10: an enumerator over the names of all items.
    virtual HRESULT SearchForItemNames(IuxSysEnumStringList** names) = 0;
    // Slot 11: a new bag with all properties of the named item.
    virtual HRESULT GetPropertiesOfItem(const wchar_t* item, IuxSysPropertyBag** properties) = 0;
    // Slot 12: a new bag with the requested properties of the named item; S_FALSE when only
    // some of them exist.
    virtual HRESULT PopulateOrRefreshProperties(const wchar_t* item, uint32_t count,
                                                const uint32_t* tags,
                                                IuxSysPropertyBag** properties) = 0;

  protected:
    ~IuxSysExpert() = default;
};

class IuxSysExpert2 : public IuxSysExpert {
  public:
    // Slot 13: not supported; returns E_NOTIMPL.
    virtual HRESULT ReservedExpert13() = 0;
    // Slot 14: not supported; returns E_NOTIMPL.
    virtual HRESULT ReservedExpert14() = 0;
    // Slot 15: checks the modified properties of `changes`; `validated` receives the accepted
    // tags and `message` (may be null) an explanation for a rejected value.
    virtual HRESULT ValidatePropertyChanges(const wchar_t* item, IuxSysPropertyBag* changes,
                                            IuxSysEnumPropertyTag** validated,
                                            CvqBStr* message) = 0;
    // Slot 16: applies the modified properties of `changes`; *restartRequired becomes 1 when
    // the change takes full effect only after a restart.
    virtual HRESULT PersistPropertyChanges(const wchar_t* item, IuxSysPropertyBag* changes,
                                           int32_t* restartRequired) = 0;

  protected:
    ~IuxSysExpert2() = default;
};

class IuxSysExpert3 : public IuxSysExpert2 {
  public:
    // Slot 17: returns S_FALSE.
    // NOLINTNEXTLINE(bugprone-virtual-near-miss): a new slot, unrelated to slots 13 and 14
    virtual HRESULT ReservedExpert17() = 0;

  protected:
    ~IuxSysExpert3() = default;
};

class IuxSysExpertPlugPlay : public IUnknown {
  public:
    // Slot 3: registers the host's plug-and-play callback (null unregisters).
    virtual HRESULT SetPlugPlayCallback(IUnknown* callback) = 0;

  protected:
    ~IuxSysExpertPlugPlay() = default;
};

class IuxSysExpertImportExport : public IUnknown {
  public:
    // Slot 3: an enumerator over the item's tags that a saved configuration may set;
    // S_FALSE (null) when there are none.
    virtual HRESULT GetImportableTags(const wchar_t* item, IuxSysEnumPropertyTag** tags) = 0;
    // Slot 4: the names of the items matching `description`; `exactName` receives the item
    // that matches exactly, if any; `reserved` is only set to null.
    virtual HRESULT GetMatchingItems(IuxSysPropertyBag* description, CvqBStr* exactName,
                                     IuxSysEnumStringList** names, void** reserved) = 0;
    // Slot 5: not supported; returns E_NOTIMPL.
    virtual HRESULT ReservedImportExport5() = 0;

  protected:
    ~IuxSysExpertImportExport() = default;
};

class IuxSysExpertFirmware : public IUnknown {
  public:
    // Slot 3: announces an update of `imageSize` bytes; `updateId` receives its identifier.
    virtual HRESULT PrepareFirmwareUpdate(const wchar_t* item, uint32_t flags, uint32_t imageSize,
                                          CvqBStr* updateId) = 0;
    // Slot 4: hands over the image (an IuxSysFirmwareImageSource or IuxSysFirmwareImageFile)
    // and starts installing it in the background.
    virtual HRESULT StartFirmwareUpdate(const wchar_t* item, const wchar_t* updateId,
                                        uint32_t flags, void* reserved, IUnknown* imageSource) = 0;
    // Slot 5: not supported; returns E_NOTIMPL.
    virtual HRESULT ReservedFirmware5() = 0;
    // Slot 6: not supported; returns E_NOTIMPL.
    virtual HRESULT ReservedFirmware6() = 0;
    // Slot 7: the update's state (UX_FIRMWARE_STATE_*) and progress in percent.
    virtual HRESULT GetFirmwareUpdateStatus(const wchar_t* item, int32_t* state,
                                            int32_t* percent) = 0;

  protected:
    ~IuxSysExpertFirmware() = default;
};

class IuxSysFrameworkNotificationHandler : public IUnknown {
  public:
    // Slot 3: a framework notification; this expert declines all with E_NOTIMPL.
    virtual HRESULT HandleFrameworkNotification(uint32_t notification, IUnknown* details) = 0;

  protected:
    ~IuxSysFrameworkNotificationHandler() = default;
};

// The plug-in's one exported function: stores the expert's primary interface with one
// reference (owned by the caller) in *expert. E_POINTER for a null argument.
extern "C" __attribute__((visibility("default"))) HRESULT createKestSysApiChassisExpert(
    IuxSysExpert3** expert);

// The name and type under which a host looks the factory up with dlsym.
inline constexpr char KEST_EXPERT_FACTORY_SYMBOL[] = "createKestSysApiChassisExpert";
using PFN_createKestSysApiChassisExpert = HRESULT (*)(IuxSysExpert3** expert);
