// Typed access to the simulated controller's state document: numbers, flags and addresses by
// section and key, and the device sections [Device0], [Device1], ... in device order.
#pragma once

#include <cstdint>
#include <stdexcept>
#include <string>
#include <vector>

#include "StateDocument.h"
#include "vq/dsc/IPAddress.h"

namespace kest::sim {

// A value in the state file is not of its key's kind; what() names section, key and value.
class MalformedState : public std::runtime_error {
  public:
    using std::runtime_error::runtime_error;
};

// Parses an integer written in decimal or with a "0x" prefix in hexadecimal, with an optional
// leading "-"; false for anything else or a magnitude above 0xFFFFFFFF.
bool ParseStateNumber(const std::string& text, int64_t& value);

class ControllerState {
  public:
    explicit ControllerState(StateDocument document) : document_(std::move(document)) {}

    const StateDocument& Document() const { return document_; }
    // True once a setter has changed a value.
    bool Modified() const { return modified_; }

    // Each getter returns false and leaves its output untouched when the key is absent, and
    // throws MalformedState when the value is not of the requested kind.
    bool GetText(const std::string& section, const std::string& key, std::string& text) const;
    bool GetUnsigned(const std::string& section, const std::string& key, uint32_t& value) const;
    bool GetSigned(const std::string& section, const std::string& key, int32_t& value) const;
    // A flag is a number: nonzero is true.
    bool GetFlag(const std::string& section, const std::string& key, bool& value) const;
    // An empty value is the unset address.
    bool GetAddress(const std::string& section, const std::string& key,
                    vq::dsc::osdep::IPAddress& address) const;

    void SetText(const std::string& section, const std::string& key, const std::string& text);
    void SetUnsigned(const std::string& section, const std::string& key, uint32_t value);
    void SetFlag(const std::string& section, const std::string& key, bool value);
    // Written as its display text; the unset address as an empty value.
    void SetAddress(const std::string& section, const std::string& key,
                    const vq::dsc::osdep::IPAddress& address);

    // Names of the sections "Device" followed by a decimal number, ordered by that number.
    std::vector<std::string> DeviceSections() const;
    // A device's index: its Index key, or the number in its section name when that key is absent.
    uint32_t DeviceIndex(const std::string& deviceSection) const;
    // The section of the device with `index`; empty when there is none.
    std::string FindDevice(uint32_t index) const;
    // The section of the first device whose `key` equals `value` ASCII case-insensitively; empty
    // when there is none or `value` is empty.
    std::string FindDeviceWith(const std::string& key, const std::string& value) const;

  private:
    int64_t GetNumber(const std::string& section, const std::string& key, int64_t low, int64_t high,
                      bool& present) const;

    StateDocument document_;
    bool modified_ = false;
};

}  // namespace kest::sim
