// The firmware image kestcfg hands to the plug-in: a regular file, offered by its path through
// the image-file interface, so that the plug-in links or copies it instead of kestcfg reading
// it into memory. The bytes are mapped only if the plug-in asks for them.
#pragma once

#include <atomic>
#include <cstdint>
#include <string>

#include "support/FileDescriptor.h"
#include "uxsys/Expert.h"

namespace kest::cfg {

class HostFirmwareImage : public IuxSysFirmwareImageFile {
  public:
    // Opens the file at `path` without blocking (a FIFO must not hang kestcfg) and checks it:
    // a readable, regular, non-empty file of less than 4 GiB. Throws a usage error naming the
    // path otherwise.
    explicit HostFirmwareImage(const std::string& path);
    ~HostFirmwareImage();
    HostFirmwareImage(const HostFirmwareImage&) = delete;
    HostFirmwareImage& operator=(const HostFirmwareImage&) = delete;

    // Answers IUnknown and the image-source and image-file interfaces. The object lives on its
    // owner's stack: the counts only track the plug-in's references.
    HRESULT QueryInterface(const IID& iid, void** object) override;
    uint32_t AddRef() override;
    uint32_t Release() override;

    uint32_t GetImageSize() override;
    // The file's bytes, mapped on the first call; null when they cannot be mapped.
    const uint8_t* GetImageBytes() override;
    // The file's absolute path as a new host string.
    HRESULT GetImageFilePath(CvqBStr* path) override;

  private:
    kest::FileDescriptor descriptor_;
    std::string path_;  // absolute
    uint32_t size_ = 0;
    void* mapped_ = nullptr;
    std::atomic<uint32_t> references_{1};
};

}  // namespace kest::cfg
