// Random sequences of property-bag operations checked against a plain model of the bag: typed
// values per tag, the modified set, enumerators over snapshots, copies, and the caller lock.
#include <fuzzer/FuzzedDataProvider.h>

#include <algorithm>
#include <cstdint>
#include <cstring>
#include <cwchar>
#include <map>
#include <string>
#include <vector>

#include "FuzzCheck.h"
#include "com/CountedPtr.h"
#include "kest/ChassisTags.h"
#include "property/CuxDynamicPropertyBag.h"
#include "uxsys/HostString.h"
#include "uxsys/StatusCodes.h"

namespace {

constexpr uint32_t kTags[] = {0,          1,          2,          kest::tag::kHostName,
                              0x7FFFFFFF, 0x80000000, 0xFFFFFFFE, 0xFFFFFFFF};

// One value of the model: its type code and its bytes (the wide characters of a string).
struct ModelValue {
    uint32_t type = 0;
    std::string bytes;
    bool modified = false;
};

using Model = std::map<uint32_t, ModelValue>;

template <class T>
std::string BytesOf(const T& value) {
    return std::string(reinterpret_cast<const char*>(&value), sizeof value);
}

std::string BytesOf(const std::wstring& text) {
    return std::string(reinterpret_cast<const char*>(text.data()), text.size() * sizeof(wchar_t));
}

class BagSession {
  public:
    explicit BagSession(FuzzedDataProvider& input) : input_(input), bag_(CreatePropertyBag()) {}

    ~BagSession() {
        while (lockDepth_ > 0) {
            FUZZ_CHECK(bag_->UnlockBag() == S_OK);
            --lockDepth_;
        }
        FUZZ_CHECK(bag_->UnlockBag() == E_FAIL);
    }

    BagSession(const BagSession&) = delete;
    BagSession& operator=(const BagSession&) = delete;

    void Step() {
        const uint32_t tag = input_.PickValueInArray(kTags);
        switch (input_.ConsumeIntegralInRange<int>(0, 20)) {
            case 0: {
                const int32_t value = input_.ConsumeIntegral<int32_t>();  // nonzero is true
                return Set(tag, UX_PROPERTY_TYPE_BOOL, BytesOf<bool>(value != 0),
                           bag_->SetBool(tag, value));
            }
            case 1: {
                const int32_t value = input_.ConsumeIntegral<int32_t>();
                return Set(tag, UX_PROPERTY_TYPE_LONG, BytesOf(value), bag_->SetLong(tag, value));
            }
            case 2: {
                const uint32_t value = input_.ConsumeIntegral<uint32_t>();
                return Set(tag, UX_PROPERTY_TYPE_ULONG, BytesOf(value), bag_->SetULong(tag, value));
            }
            case 3: {
                const uint64_t pattern = input_.ConsumeIntegral<uint64_t>();
                double value = 0;
                std::memcpy(&value, &pattern, sizeof value);
                return Set(tag, UX_PROPERTY_TYPE_DOUBLE, BytesOf(value),
                           bag_->SetDouble(tag, value));
            }
            case 4: {
                GUID value{};
                input_.ConsumeData(&value, sizeof value);
                return Set(tag, UX_PROPERTY_TYPE_GUID, BytesOf(value), bag_->SetGuid(tag, value));
            }
            case 5: {
                const std::wstring text = ConsumeText();
                return Set(tag, UX_PROPERTY_TYPE_STRING, BytesOf(text),
                           bag_->SetString(tag, text.c_str()));
            }
            case 6: {
                uxSysAttrTimestampUTC value{};
                value.fraction = input_.ConsumeIntegral<uint64_t>();
                value.seconds = input_.ConsumeIntegral<int64_t>();
                return Set(tag, UX_PROPERTY_TYPE_TIMESTAMP, BytesOf(value),
                           bag_->SetTimestamp(tag, value));
            }
            case 7:
                return Get(tag);
            case 8:
                FUZZ_CHECK(bag_->HasTag(tag) == (model_.count(tag) != 0 ? S_OK : S_FALSE));
                break;
            case 9: {
                uint32_t type = 0;
                const HRESULT status = bag_->GetTagType(tag, &type);
                FUZZ_CHECK(status == Presence(tag));
                FUZZ_CHECK(status != S_OK || type == model_[tag].type);
                break;
            }
            case 10:
                FUZZ_CHECK(bag_->RemoveTag(tag) == Presence(tag));
                model_.erase(tag);
                break;
            case 11:
                FUZZ_CHECK(bag_->RemoveAllTags() == S_OK);
                model_.clear();
                break;
            case 12: {
                const bool any = !Tags(true).empty();
                FUZZ_CHECK(bag_->ClearAllModified() == (any ? S_OK : S_FALSE));
                for (auto& entry : model_) {
                    entry.second.modified = false;
                }
                break;
            }
            case 13:
                return ClearModified(tag);
            case 14:
                FUZZ_CHECK(bag_->MarkModified(tag) == Presence(tag));
                if (model_.count(tag) != 0) {
                    model_[tag].modified = true;
                }
                break;
            case 15: {
                CountedPtr<IuxSysEnumPropertyTag> tags;
                const HRESULT status = bag_->GetTagEnumerator(tags.Receive());
                CheckEnumerator(status, tags.Get(), Tags(false));
                break;
            }
            case 16: {
                CountedPtr<IuxSysEnumPropertyTag> tags;
                const HRESULT status = bag_->GetModifiedTagEnumerator(tags.Receive());
                CheckEnumerator(status, tags.Get(), Tags(true));
                break;
            }
            case 17:
                return Clone();
            case 18:
                FUZZ_CHECK(bag_->LockBag() == S_OK);
                ++lockDepth_;
                break;
            case 19:
                FUZZ_CHECK(bag_->UnlockBag() == (lockDepth_ > 0 ? S_OK : E_FAIL));
                lockDepth_ -= lockDepth_ > 0 ? 1 : 0;
                break;
            default:
                return TimestampFields(tag);
        }
    }

  private:
    HRESULT Presence(uint32_t tag) const {
        return model_.count(tag) != 0 ? S_OK : UX_E_PROPERTY_NOT_FOUND;
    }

    // Expected result of a getter of `type`.
    HRESULT Expected(uint32_t tag, uint32_t type) const {
        const auto found = model_.find(tag);
        if (found == model_.end()) {
            return UX_E_PROPERTY_NOT_FOUND;
        }
        return found->second.type == type ? S_OK : UX_E_PROPERTY_TYPE_MISMATCH;
    }

    // Checks the status of a setter call that stored `bytes` as `type`, and records the value.
    void Set(uint32_t tag, uint32_t type, const std::string& bytes, HRESULT status) {
        const auto found = model_.find(tag);
        if (found != model_.end() && found->second.type != type) {
            FUZZ_CHECK(status == UX_E_PROPERTY_TYPE_MISMATCH);
            return;
        }
        FUZZ_CHECK(status == S_OK);
        model_[tag] = ModelValue{type, bytes, true};
    }

    // Up to 40 nonzero 32-bit units.
    std::wstring ConsumeText() {
        std::wstring text;
        const size_t length = input_.ConsumeIntegralInRange<size_t>(0, 40);
        for (size_t i = 0; i < length; ++i) {
            const wchar_t unit = static_cast<wchar_t>(input_.ConsumeIntegral<uint32_t>());
            if (unit == L'\0') {
                break;
            }
            text += unit;
        }
        return text;
    }

    template <class Bag, class T>
    void GetTyped(uint32_t tag, uint32_t type, HRESULT (Bag::*getter)(uint32_t, T*)) {
        T value{};
        const HRESULT status = (bag_.Get()->*getter)(tag, &value);
        FUZZ_CHECK(status == Expected(tag, type));
        FUZZ_CHECK(status != S_OK || BytesOf(value) == model_[tag].bytes);
    }

    void Get(uint32_t tag) {
        switch (input_.ConsumeIntegralInRange<int>(0, 6)) {
            case 0: {
                int32_t value = 7;
                const HRESULT status = bag_->GetBool(tag, &value);
                FUZZ_CHECK(status == Expected(tag, UX_PROPERTY_TYPE_BOOL));
                const bool stored = status == S_OK && model_[tag].bytes == BytesOf<bool>(true);
                FUZZ_CHECK(value == (stored ? 1 : 0));
                return;
            }
            case 1:
                return GetTyped(tag, UX_PROPERTY_TYPE_LONG, &IuxSysPropertyBag4::GetLong);
            case 2:
                return GetTyped(tag, UX_PROPERTY_TYPE_ULONG, &IuxSysPropertyBag4::GetULong);
            case 3:
                return GetTyped(tag, UX_PROPERTY_TYPE_DOUBLE, &IuxSysPropertyBag4::GetDouble);
            case 4:
                return GetTyped(tag, UX_PROPERTY_TYPE_GUID, &IuxSysPropertyBag4::GetGuid);
            case 5:
                return GetTyped(tag, UX_PROPERTY_TYPE_TIMESTAMP, &IuxSysPropertyBag4::GetTimestamp);
            default: {
                CvqBStr text = reinterpret_cast<CvqBStr>(this);
                const HRESULT status = bag_->GetString(tag, &text);
                CvqBStrHolder holder(text);
                FUZZ_CHECK(status == Expected(tag, UX_PROPERTY_TYPE_STRING));
                FUZZ_CHECK(status == S_OK ? CvqBStrLength(text) == std::wcslen(text) &&
                                                BytesOf(std::wstring(text)) == model_[tag].bytes
                                          : text == nullptr);
                return;
            }
        }
    }

    void ClearModified(uint32_t tag) {
        const auto found = model_.find(tag);
        HRESULT expected = UX_E_PROPERTY_NOT_FOUND;
        if (found != model_.end()) {
            expected = found->second.modified ? S_OK : S_FALSE;
            found->second.modified = false;
        }
        int32_t stillModified = 7;
        const bool askStill = input_.ConsumeBool();
        FUZZ_CHECK(bag_->ClearModified(tag, askStill ? &stillModified : nullptr) == expected);
        if (askStill) {
            FUZZ_CHECK(stillModified == (Tags(true).empty() ? 0 : 1));
        }
    }

    std::vector<uint32_t> Tags(bool modifiedOnly) const {
        std::vector<uint32_t> tags;
        for (const auto& entry : model_) {
            if (entry.second.modified || !modifiedOnly) {
                tags.push_back(entry.first);
            }
        }
        return tags;
    }

    // Walks the enumerator with fuzzed Next counts, Skip, Reset and Clone.
    void CheckEnumerator(HRESULT status, IuxSysEnumPropertyTag* tags,
                         const std::vector<uint32_t>& expected) {
        if (expected.empty()) {
            FUZZ_CHECK(status == S_FALSE && tags == nullptr);
            return;
        }
        FUZZ_CHECK(status == S_OK && tags != nullptr);
        CountedPtr<IuxSysEnumPropertyTag> current(tags);
        size_t position = 0;
        for (int step = input_.ConsumeIntegralInRange<int>(1, 8); step > 0; --step) {
            const uint32_t count = input_.ConsumeIntegralInRange<uint32_t>(0, 5);
            switch (input_.ConsumeIntegralInRange<int>(0, 3)) {
                case 0: {
                    std::vector<uint32_t> out(count + 1, 0xABABABAB);
                    uint32_t fetched = 99;
                    const HRESULT next = current->Next(count, out.data(), &fetched);
                    const size_t available = expected.size() - position;
                    const size_t taken = std::min<size_t>(count, available);
                    FUZZ_CHECK(next == (taken == count ? S_OK : S_FALSE));
                    FUZZ_CHECK(fetched == taken);
                    for (size_t i = 0; i < taken; ++i) {
                        FUZZ_CHECK(out[i] == expected[position + i]);
                    }
                    FUZZ_CHECK(out[taken] == 0xABABABAB);
                    position += taken;
                    break;
                }
                case 1: {
                    const size_t available = expected.size() - position;
                    FUZZ_CHECK(current->Skip(count) == (count <= available ? S_OK : S_FALSE));
                    position += std::min<size_t>(count, available);
                    break;
                }
                case 2:
                    FUZZ_CHECK(current->Reset() == S_OK);
                    position = 0;
                    break;
                default: {
                    CountedPtr<IuxSysEnumPropertyTag> copy;
                    FUZZ_CHECK(current->Clone(copy.Receive()) == S_OK && copy);
                    current = copy;
                    break;
                }
            }
        }
    }

    void Clone() {
        CountedPtr<IuxSysPropertyBag> copy;
        FUZZ_CHECK(bag_->Clone(copy.Receive()) == S_OK && copy);
        CountedPtr<IuxSysPropertyBag4> copy4 =
            QueryCounted<IuxSysPropertyBag4>(copy, IID_IuxSysPropertyBag4);
        FUZZ_CHECK(copy4.Get() != nullptr);
        CountedPtr<IuxSysEnumPropertyTag> modified;
        FUZZ_CHECK(copy4->GetModifiedTagEnumerator(modified.Receive()) == S_FALSE);
        if (!input_.ConsumeBool()) {
            return;
        }
        // Carry on with the copy: same values, nothing modified, not locked.
        while (lockDepth_ > 0) {
            FUZZ_CHECK(bag_->UnlockBag() == S_OK);
            --lockDepth_;
        }
        bag_ = copy4;
        for (auto& entry : model_) {
            entry.second.modified = false;
        }
    }

    void TimestampFields(uint32_t tag) {
        int32_t fields[6] = {7, 7, 7, 7, 7, 7};
        const HRESULT status = bag_->GetTimestampFields(tag, fields);
        FUZZ_CHECK(status == Expected(tag, UX_PROPERTY_TYPE_TIMESTAMP));
        const bool allUnset = std::all_of(fields, fields + 6, [](int32_t f) { return f == -1; });
        if (status != S_OK) {
            FUZZ_CHECK(allUnset);
            return;
        }
        if (!allUnset) {
            FUZZ_CHECK(fields[1] >= 1 && fields[1] <= 12 && fields[2] >= 1 && fields[2] <= 31);
            FUZZ_CHECK(fields[3] >= 0 && fields[3] <= 23 && fields[4] >= 0 && fields[4] <= 59);
            FUZZ_CHECK(fields[5] >= 0 && fields[5] <= 60);
        }
    }

    FuzzedDataProvider& input_;
    CountedPtr<IuxSysPropertyBag4> bag_;
    Model model_;
    int lockDepth_ = 0;
};

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    FuzzedDataProvider input(data, size);
    BagSession session(input);
    while (input.remaining_bytes() > 0) {
        session.Step();
    }
    return 0;
}
