// The firmware image kestcfg hands to the plug-in: a file's bytes held in memory, offered through
// the image-source interface.
#pragma once

#include <atomic>
#include <cstdint>
#include <string>
#include <vector>

#include "uxsys/Expert.h"

class HostFirmwareImage : public IuxSysFirmwareImageSource {
  public:
    // Reads the whole file at `path`. Throws a failure when it cannot be read or holds more
    // bytes than a 32-bit count can announce.
    explicit HostFirmwareImage(const std::string& path);
    HostFirmwareImage(const HostFirmwareImage&) = delete;
    HostFirmwareImage& operator=(const HostFirmwareImage&) = delete;

    // Answers IUnknown and the image-source interface. The object lives on its owner's stack:
    // the counts only track the plug-in's references.
    HRESULT QueryInterface(const IID& iid, void** object) override;
    uint32_t AddRef() override;
    uint32_t Release() override;

    uint32_t GetImageSize() override;
    const uint8_t* GetImageBytes() override;

  private:
    std::vector<uint8_t> bytes_;
    std::atomic<uint32_t> references_{1};
};
