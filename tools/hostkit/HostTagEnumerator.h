// A tag enumerator that kestcfg hands to the plug-in: a snapshot of tags in ascending order.
#pragma once

#include <atomic>
#include <cstdint>
#include <memory>
#include <vector>

#include "hostkit/InterfaceRef.h"
#include "uxsys/Enumerators.h"

namespace kest::hostkit {

class HostTagEnumerator final : public IuxSysEnumPropertyTag {
  public:
    // A new enumerator over `tags`, positioned at the first, with one reference for the caller.
    static InterfaceRef<IuxSysEnumPropertyTag> Create(std::vector<uint32_t> tags);

    HRESULT QueryInterface(const IID& iid, void** object) override;
    uint32_t AddRef() override;
    uint32_t Release() override;
    HRESULT Next(uint32_t count, uint32_t* tags, uint32_t* fetched) override;
    HRESULT Skip(uint32_t count) override;
    HRESULT Reset() override;
    HRESULT Clone(IuxSysEnumPropertyTag** copy) override;

  private:
    HostTagEnumerator(std::shared_ptr<const std::vector<uint32_t>> tags, size_t position);
    ~HostTagEnumerator() = default;

    std::atomic<uint32_t> references_{1};
    // Clones share the list; each has its own position.
    std::shared_ptr<const std::vector<uint32_t>> tags_;
    size_t position_;
};

}  // namespace kest::hostkit
