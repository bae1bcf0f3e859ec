// The plug-in's property bag through its interface beside a plain std::map of variants, the floor
// any bag of typed values stands on: setting 30 values of every type into a new bag, getting
// them back (strings as copies, as a host receives them) and enumerating the tags.
#include <benchmark/benchmark.h>

#include <map>
#include <string>
#include <variant>
#include <vector>

#include "property/CuxDynamicPropertyBag.h"

namespace {

constexpr uint32_t kValueCount = 30;
constexpr uint32_t kTypeCount = 7;
constexpr GUID kGuid = {
    0x999d9aa4, 0x5475, 0x4ca7, {0xa5, 0x60, 0x93, 0xc5, 0x1b, 0x5b, 0xfc, 0xeb}};
constexpr wchar_t kText[] = L"Europe/Berlin";
constexpr uxSysAttrTimestampUTC kTimestamp = {0x8000000000000000ULL, 3786825600};

uint32_t TagOf(uint32_t i) {
    return 0x01001000 + i * 0x1000;
}

void FillBag(IuxSysPropertyBag4& bag) {
    for (uint32_t i = 0; i < kValueCount; ++i) {
        const uint32_t tag = TagOf(i);
        switch (i % kTypeCount) {
            case 0:
                bag.SetBool(tag, 1);
                break;
            case 1:
                bag.SetLong(tag, -static_cast<int32_t>(i));
                break;
            case 2:
                bag.SetULong(tag, i);
                break;
            case 3:
                bag.SetDouble(tag, i * 0.5);
                break;
            case 4:
                bag.SetGuid(tag, kGuid);
                break;
            case 5:
                bag.SetString(tag, kText);
                break;
            default:
                bag.SetTimestamp(tag, kTimestamp);
                break;
        }
    }
}

void GetAll(IuxSysPropertyBag4& bag) {
    for (uint32_t i = 0; i < kValueCount; ++i) {
        const uint32_t tag = TagOf(i);
        switch (i % kTypeCount) {
            case 0: {
                int32_t value;
                bag.GetBool(tag, &value);
                benchmark::DoNotOptimize(value);
                break;
            }
            case 1: {
                int32_t value;
                bag.GetLong(tag, &value);
                benchmark::DoNotOptimize(value);
                break;
            }
            case 2: {
                uint32_t value;
                bag.GetULong(tag, &value);
                benchmark::DoNotOptimize(value);
                break;
            }
            case 3: {
                double value;
                bag.GetDouble(tag, &value);
                benchmark::DoNotOptimize(value);
                break;
            }
            case 4: {
                GUID value;
                bag.GetGuid(tag, &value);
                benchmark::DoNotOptimize(value);
                break;
            }
            case 5: {
                CvqBStr value = nullptr;
                bag.GetString(tag, &value);
                benchmark::DoNotOptimize(value);
                CvqBStrFree(value);
                break;
            }
            default: {
                uxSysAttrTimestampUTC value;
                bag.GetTimestamp(tag, &value);
                benchmark::DoNotOptimize(value);
                break;
            }
        }
    }
}

void PropertyBag_Set30(benchmark::State& state) {
    for (auto _ : state) {
        CountedPtr<IuxSysPropertyBag4> bag = CreatePropertyBag();
        FillBag(*bag);
    }
}
BENCHMARK(PropertyBag_Set30);

void PropertyBag_Get30(benchmark::State& state) {
    CountedPtr<IuxSysPropertyBag4> bag = CreatePropertyBag();
    FillBag(*bag);
    for (auto _ : state) {
        GetAll(*bag);
    }
}
BENCHMARK(PropertyBag_Get30);

void PropertyBag_Enumerate30(benchmark::State& state) {
    CountedPtr<IuxSysPropertyBag4> bag = CreatePropertyBag();
    FillBag(*bag);
    uint32_t tags[kValueCount];
    for (auto _ : state) {
        IuxSysEnumPropertyTag* enumerator = nullptr;
        bag->GetTagEnumerator(&enumerator);
        uint32_t fetched = 0;
        enumerator->Next(kValueCount, tags, &fetched);
        enumerator->Release();
        benchmark::DoNotOptimize(tags);
    }
}
BENCHMARK(PropertyBag_Enumerate30);

using Value =
    std::variant<bool, int32_t, uint32_t, double, GUID, std::wstring, uxSysAttrTimestampUTC>;
using ValueMap = std::map<uint32_t, Value>;

void FillMap(ValueMap& values) {
    for (uint32_t i = 0; i < kValueCount; ++i) {
        Value& value = values[TagOf(i)];
        switch (i % kTypeCount) {
            case 0:
                value = true;
                break;
            case 1:
                value = -static_cast<int32_t>(i);
                break;
            case 2:
                value = i;
                break;
            case 3:
                value = i * 0.5;
                break;
            case 4:
                value = kGuid;
                break;
            case 5:
                value = std::wstring(kText);
                break;
            default:
                value = kTimestamp;
                break;
        }
    }
}

void StdMap_Set30(benchmark::State& state) {
    for (auto _ : state) {
        ValueMap values;
        FillMap(values);
        benchmark::DoNotOptimize(values);
    }
}
BENCHMARK(StdMap_Set30);

void StdMap_Get30(benchmark::State& state) {
    ValueMap values;
    FillMap(values);
    for (auto _ : state) {
        for (uint32_t i = 0; i < kValueCount; ++i) {
            Value copy = values.find(TagOf(i))->second;
            benchmark::DoNotOptimize(copy);
        }
    }
}
BENCHMARK(StdMap_Get30);

void StdMap_Enumerate30(benchmark::State& state) {
    ValueMap values;
    FillMap(values);
    for (auto _ : state) {
        std::vector<uint32_t> tags;
        tags.reserve(values.size());
        for (const auto& entry : values) {
            tags.push_back(entry.first);
        }
        benchmark::DoNotOptimize(tags.data());
    }
}
BENCHMARK(StdMap_Enumerate30);

}  // namespace
