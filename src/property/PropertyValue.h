// Typed property values: one value class per property type code. A bag owns the values it holds;
// the type code fixed at construction decides which typed access applies to a value.
// Thread safety: none of their own; a bag touches its values only under its lock.
#pragma once

#include <cstdint>
#include <memory>
#include <utility>

#include "uxsys/HostString.h"
#include "uxsys/PropertyBag.h"
#include "uxsys/Types.h"

// The type code that belongs to each stored value type.
template <class T>
struct PropertyTypeCodeOf;
template <>
struct PropertyTypeCodeOf<bool> {
    static constexpr uint32_t value = UX_PROPERTY_TYPE_BOOL;
};
template <>
struct PropertyTypeCodeOf<int32_t> {
    static constexpr uint32_t value = UX_PROPERTY_TYPE_LONG;
};
template <>
struct PropertyTypeCodeOf<uint32_t> {
    static constexpr uint32_t value = UX_PROPERTY_TYPE_ULONG;
};
template <>
struct PropertyTypeCodeOf<double> {
    static constexpr uint32_t value = UX_PROPERTY_TYPE_DOUBLE;
};
template <>
struct PropertyTypeCodeOf<GUID> {
    static constexpr uint32_t value = UX_PROPERTY_TYPE_GUID;
};
template <>
struct PropertyTypeCodeOf<CvqBStr> {
    static constexpr uint32_t value = UX_PROPERTY_TYPE_STRING;
};
template <>
struct PropertyTypeCodeOf<uxSysAttrTimestampUTC> {
    static constexpr uint32_t value = UX_PROPERTY_TYPE_TIMESTAMP;
};

// Base of every property value: carries the type code of the derived value class.
class CuxPropertyValue {
  public:
    virtual ~CuxPropertyValue() = default;
    CuxPropertyValue(const CuxPropertyValue&) = delete;
    CuxPropertyValue& operator=(const CuxPropertyValue&) = delete;

    // The type code of the stored value (1 to 7).
    uint32_t TypeCode() const { return typeCode_; }
    // A new value of the same type holding a copy of this one; throws std::bad_alloc.
    virtual std::unique_ptr<CuxPropertyValue> Copy() const = 0;

  protected:
    explicit CuxPropertyValue(uint32_t typeCode) : typeCode_(typeCode) {}

  private:
    uint32_t typeCode_;
};

// A value of a plain type (boolean, integers, double, GUID, timestamp), copied in and out.
template <class T>
class CuxTemplatePropertyValue final : public CuxPropertyValue {
  public:
    explicit CuxTemplatePropertyValue(const T& value)
        : CuxPropertyValue(PropertyTypeCodeOf<T>::value), value_(value) {}

    const T& Value() const { return value_; }
    void SetValue(const T& value) { value_ = value; }

    std::unique_ptr<CuxPropertyValue> Copy() const override {
        return std::make_unique<CuxTemplatePropertyValue>(value_);
    }

  private:
    T value_;
};

// A host-string value: owns its string and frees it on destruction.
template <>
class CuxTemplatePropertyValue<CvqBStr> final : public CuxPropertyValue {
  public:
    // Takes ownership of `value` (not null).
    explicit CuxTemplatePropertyValue(CvqBStrHolder value)
        : CuxPropertyValue(UX_PROPERTY_TYPE_STRING), value_(std::move(value)) {}

    // The stored string; it stays owned by this value.
    CvqBStr Value() const { return value_.Get(); }
    // Replaces the string with `value`, taking ownership; the old string is freed.
    void SetValue(CvqBStrHolder value) { value_ = std::move(value); }

    std::unique_ptr<CuxPropertyValue> Copy() const override;

  private:
    CvqBStrHolder value_;
};

// A new host string with the characters of the host string `source` (embedded zeros included);
// throws std::bad_alloc when it cannot be allocated.
CvqBStrHolder CopyHostString(const wchar_t* source);

// The value as a T, or null when it is missing or holds another type.
template <class T>
CuxTemplatePropertyValue<T>* PropertyValueAs(CuxPropertyValue* value) {
    if (value == nullptr || value->TypeCode() != PropertyTypeCodeOf<T>::value) {
        return nullptr;
    }
    return static_cast<CuxTemplatePropertyValue<T>*>(value);
}
