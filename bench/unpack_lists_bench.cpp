// The two list decoders of system management against scanning alone:
// UnpackSystemNameList (ITavBoot) at 10, 1,000 and 100,000 names and
// UnpackStorageDevices2 (ITavDynamicDevices2) at 10, 1,000 and 65,535
// devices, the most its 16-bit element counter can end on (a longer list is
// read until an element fails, and so is refused). Each reply text is built
// once, outside the timed loop; the enumerator is released inside it, as a
// client releases it. The baselines read the same text with the decoders'
// own formats (the count, the tokeniser; the head and element scans) into
// plain arrays allocated before timing, and nothing else; a second baseline
// adds the string that each element needs, to show where the time goes.
#include <benchmark/benchmark.h>

#include <cstdint>
#include <cstdio>
#include <map>
#include <string>
#include <vector>

#include "TavController.h"
#include "bench_support.h"
#include "core/text/format.h"
#include "core/text/number.h"
#include "core/text/scan.h"
#include "core/text/tokenize.h"
#include "tav/bstr.h"
#include "tav/com_ptr.h"
#include "tav/variant.h"

namespace {

using tav::Bstr;
using tav::ComPtr;
using tav::OleString;
using tav::OleStringView;

constexpr std::int64_t kNameSizes[] = {10, 1'000, 100'000};
constexpr std::int64_t kDeviceSizes[] = {10, 1'000, 65'535};

// ITavDynamicDevices2 comes with the ninth class; the last one answers all.
class Client : public tav::bench::Client {
public:
    Client() : tav::bench::Client(CLSID_TavController17) {
        if (Failure() == nullptr &&
            (FAILED(QueryTo(Controller(), boot_)) || FAILED(QueryTo(Controller(), devices_)))) {
            Fail("cannot reach the controller's ITavBoot or ITavDynamicDevices2");
        }
    }
    ITavBoot* Boot() const { return boot_.Get(); }
    ITavDynamicDevices2* Devices() const { return devices_.Get(); }

private:
    ComPtr<ITavBoot> boot_;
    ComPtr<ITavDynamicDevices2> devices_;
};

Client* TheClient = nullptr;

OleStringView TextOf(const tav::Variant& reply) {
    const BSTR text = reply.Get()->bstrVal;
    return OleStringView(text, SysStringLen(text));
}

VARIANT* Lent(const tav::Variant& reply) { return const_cast<VARIANT*>(reply.Get()); }

// ---- System names -------------------------------------------------------

OleString NameAt(std::int64_t i) { return tav::text::Format(OLESTR("Cell%d_RW6_%d"), i % 97, i); }

const tav::Variant& NamesReply(std::int64_t count) {
    static std::map<std::int64_t, tav::Variant> replies;
    tav::Variant& reply = replies[count];
    if (reply.Type() != VT_BSTR) {
        OleString text = tav::text::Format(OLESTR("-NoOfElements %d -Names "), count);
        for (std::int64_t i = 0; i < count; ++i) {
            text += NameAt(i);
            text += u',';
        }
        reply.SetBstr(Bstr(text));
    }
    return reply;
}

// The count and every name as the decoder finds them, into names (room for
// them all); the number of names, -1 when the head does not read.
std::int64_t ScanNames(OleStringView text, std::vector<OleStringView>& names) {
    constexpr OleStringView kCount = OLESTR("-NoOfElements ");
    constexpr OleStringView kNames = OLESTR("-Names ");
    if (text.substr(0, kCount.size()) != kCount) {
        return -1;
    }
    const tav::text::ParsedNumber<std::int32_t> count = tav::text::StrToLong(text.substr(kCount.size()));
    text = text.substr(kCount.size() + count.end);
    text = text.substr(std::min(text.find_first_not_of(OLECHAR(u' ')), text.size()));
    if (text.substr(0, kNames.size()) != kNames) {
        return -1;
    }
    tav::text::Tokenizer tokens(text.substr(kNames.size()), OLESTR(","));
    std::int64_t found = 0;
    for (; found < count.value; ++found) {
        const std::optional<OleStringView> token = tokens.Next();
        if (!token) {
            break;
        }
        names[static_cast<size_t>(found)] = *token;
    }
    return tokens.Next() ? -1 : found;
}

const char* NamesAgree(std::int64_t count) {
    std::vector<OleStringView> scanned(static_cast<size_t>(count));
    if (ScanNames(TextOf(NamesReply(count)), scanned) != count) {
        return "the baseline does not read every name";
    }
    TavRetrievalParams retrieval{};
    ComPtr<ITavEnumBSTR> names;
    if (FAILED(TheClient->Boot()->UnpackSystemNameList(Lent(NamesReply(count)), &retrieval, &names)) ||
        retrieval.noOfElts != count) {
        return "UnpackSystemNameList refuses the list";
    }
    for (std::int64_t i = 0; i < count; ++i) {
        BSTR name = nullptr;
        if (names->RemNext(1, &name, nullptr) != S_OK) {
            return "UnpackSystemNameList hands out too few names";
        }
        const bool same = tav::ViewOf(name) == scanned[static_cast<size_t>(i)] &&
                          scanned[static_cast<size_t>(i)] == OleStringView(NameAt(i));
        SysFreeString(name);
        if (!same) {
            return "UnpackSystemNameList does not give the names scanned";
        }
    }
    return nullptr;
}

// ---- Storage devices ------------------------------------------------------

constexpr const OLECHAR* kTypes[] = {OLESTR("Fixed"), OLESTR("Removable"), OLESTR("Ramdisk"), OLESTR("Remote"),
                                     OLESTR("Unknown")};
constexpr TavStorageDeviceType kTypeValues[] = {StorageDeviceType_Fixed, StorageDeviceType_Removable,
                                                StorageDeviceType_Ramdisk, StorageDeviceType_Remote,
                                                StorageDeviceType_Unknown};

OleString DeviceNameAt(std::int64_t i) { return tav::text::Format(OLESTR("USB_DISK_%d"), i); }

const tav::Variant& DevicesReply(std::int64_t count) {
    static std::map<std::int64_t, tav::Variant> replies;
    tav::Variant& reply = replies[count];
    if (reply.Type() != VT_BSTR) {
        OleString text = tav::text::Format(OLESTR("-noelts %d\t"), count);
        for (std::int64_t i = 0; i < count; ++i) {
            text += tav::text::Format(OLESTR("%s;%s;%d;%d;%d\t"), DeviceNameAt(i), kTypes[i % 5], i % 2, i / 2 % 2,
                                      i / 4 % 2);
        }
        reply.SetBstr(Bstr(text));
    }
    return reply;
}

struct ScannedDevice {
    OLECHAR name[31];
    OLECHAR type[21];
    std::int32_t enabled;
    std::int32_t readOnly;
    std::int32_t shown;
};

std::int64_t ScanDevices(OleStringView text, std::vector<ScannedDevice>& devices) {
    std::int32_t count = 0;
    std::int32_t consumed = 0;
    if (tav::text::Scan<OLESTR("-noelts %ld\t%n")>(text, &count, &consumed) != 1) {
        return -1;
    }
    OleStringView rest = text.substr(static_cast<size_t>(consumed));
    std::int64_t scanned = 0;
    for (; scanned < count; ++scanned) {
        ScannedDevice& device = devices[static_cast<size_t>(scanned)];
        if (tav::text::Scan<OLESTR("%30[^;];%20[^;];%d;%d;%d\t%n")>(rest, device.name, device.type, &device.enabled,
                                                                     &device.readOnly, &device.shown,
                                                                     &consumed) != 5) {
            break;
        }
        rest = rest.substr(static_cast<size_t>(consumed));
    }
    return scanned;
}

const char* DevicesAgree(std::int64_t count) {
    std::vector<ScannedDevice> scanned(static_cast<size_t>(count));
    if (ScanDevices(TextOf(DevicesReply(count)), scanned) != count) {
        return "the baseline does not scan every device";
    }
    TavRetrievalParams retrieval{};
    ComPtr<IEnumStorageDevices2> devices;
    if (FAILED(TheClient->Devices()->UnpackStorageDevices2(Lent(DevicesReply(count)), &retrieval, &devices)) ||
        retrieval.noOfElts != count) {
        return "UnpackStorageDevices2 refuses the list";
    }
    for (std::int64_t i = 0; i < count; ++i) {
        TavStorageDevice2 device{};
        if (devices->RemNext(1, &device, nullptr) != S_OK) {
            return "UnpackStorageDevices2 hands out too few devices";
        }
        const ScannedDevice& expected = scanned[static_cast<size_t>(i)];
        const bool same = tav::ViewOf(device.deviceName) == OleStringView(expected.name) &&
                          OleStringView(expected.name) == OleStringView(DeviceNameAt(i)) &&
                          OleStringView(expected.type) == OleStringView(kTypes[i % 5]) &&
                          device.deviceType == kTypeValues[i % 5] && device.bEnabled == expected.enabled &&
                          device.bReadOnly == expected.readOnly && device.bShowDevice == expected.shown;
        SysFreeString(device.deviceName);
        if (!same) {
            return "UnpackStorageDevices2 does not give the devices scanned";
        }
    }
    return nullptr;
}

// ---- The benchmarks -------------------------------------------------------

void ReportPerElement(benchmark::State& state, std::int64_t count) {
    state.SetItemsProcessed(state.iterations() * count);
    state.counters["per_element"] = benchmark::Counter(
        static_cast<double>(count), benchmark::Counter::kIsIterationInvariantRate | benchmark::Counter::kInvert);
}

bool Ready(benchmark::State& state, const char* disagreement) {
    if (TheClient->Failure() != nullptr) {
        state.SkipWithError(TheClient->Failure());
        return false;
    }
    if (disagreement != nullptr) {
        state.SkipWithError(disagreement);
        return false;
    }
    return true;
}

void UnpackNames(benchmark::State& state) {
    const std::int64_t count = state.range(0);
    if (!Ready(state, NamesAgree(count))) {
        return;
    }
    ITavBoot* boot = TheClient->Boot();
    VARIANT* reply = Lent(NamesReply(count));
    for (auto _ : state) {
        TavRetrievalParams retrieval{};
        ITavEnumBSTR* names = nullptr;
        benchmark::DoNotOptimize(boot->UnpackSystemNameList(reply, &retrieval, &names));
        names->Release();
    }
    ReportPerElement(state, count);
}

void ScanNamesOnly(benchmark::State& state) {
    const std::int64_t count = state.range(0);
    const OleStringView text = TextOf(NamesReply(count));
    std::vector<OleStringView> names(static_cast<size_t>(count));
    for (auto _ : state) {
        benchmark::DoNotOptimize(ScanNames(text, names));
        benchmark::ClobberMemory();
    }
    ReportPerElement(state, count);
}

void UnpackDevices(benchmark::State& state) {
    const std::int64_t count = state.range(0);
    if (!Ready(state, DevicesAgree(count))) {
        return;
    }
    ITavDynamicDevices2* source = TheClient->Devices();
    VARIANT* reply = Lent(DevicesReply(count));
    for (auto _ : state) {
        TavRetrievalParams retrieval{};
        IEnumStorageDevices2* devices = nullptr;
        benchmark::DoNotOptimize(source->UnpackStorageDevices2(reply, &retrieval, &devices));
        devices->Release();
    }
    ReportPerElement(state, count);
}

void ScanDevicesOnly(benchmark::State& state) {
    const std::int64_t count = state.range(0);
    const OleStringView text = TextOf(DevicesReply(count));
    std::vector<ScannedDevice> devices(static_cast<size_t>(count));
    for (auto _ : state) {
        benchmark::DoNotOptimize(ScanDevices(text, devices));
        benchmark::ClobberMemory();
    }
    ReportPerElement(state, count);
}

// Scanning and the one thing no decoder of these lists can avoid on top of
// it: a new string per element, freed as the enumerator's release frees it.
template <class Element, std::int64_t (*ScanList)(OleStringView, std::vector<Element>&), class NameOf,
          const tav::Variant& (*ReplyOf)(std::int64_t)>
void ScanAndAllocate(benchmark::State& state, NameOf nameOf) {
    const std::int64_t count = state.range(0);
    const OleStringView text = TextOf(ReplyOf(count));
    std::vector<Element> elements(static_cast<size_t>(count));
    std::vector<BSTR> strings(static_cast<size_t>(count));
    for (auto _ : state) {
        const std::int64_t scanned = ScanList(text, elements);
        for (std::int64_t i = 0; i < scanned; ++i) {
            const OleStringView name = nameOf(elements[static_cast<size_t>(i)]);
            strings[static_cast<size_t>(i)] = SysAllocStringLen(name.data(), static_cast<UINT>(name.size()));
        }
        benchmark::DoNotOptimize(strings.data());
        for (std::int64_t i = 0; i < scanned; ++i) {
            SysFreeString(strings[static_cast<size_t>(i)]);
        }
    }
    ReportPerElement(state, count);
}

void ScanAndAllocateNames(benchmark::State& state) {
    ScanAndAllocate<OleStringView, ScanNames, OleStringView (*)(const OleStringView&), NamesReply>(
        state, [](const OleStringView& name) { return name; });
}

void ScanAndAllocateDevices(benchmark::State& state) {
    ScanAndAllocate<ScannedDevice, ScanDevices, OleStringView (*)(const ScannedDevice&), DevicesReply>(
        state, [](const ScannedDevice& device) { return OleStringView(device.name); });
}

class RatioReporter : public tav::bench::MedianReporter {
public:
    void Finalize() override {
        ConsoleReporter::Finalize();
        Table("UnpackSystemNameList", "ScanNamesOnly", "ScanAndAllocateNames", kNameSizes);
        Table("UnpackStorageDevices2", "ScanDevicesOnly", "ScanAndAllocateDevices", kDeviceSizes);
    }

private:
    void Table(const std::string& subject, const std::string& baseline, const std::string& allocating,
               const std::int64_t (&sizes)[3]) {
        std::ostream& out = GetOutputStream();
        out << "\n" << subject << " against scanning alone, CPU time per element (ns), same process:\n"
            << "  elements      Unpack        Scan     Unpack/Scan   Scan+strings   Unpack/(Scan+strings)\n";
        double first = 0;
        double last = 0;
        for (const std::int64_t count : sizes) {
            const double unpack = Median(subject + "/" + std::to_string(count)) / static_cast<double>(count);
            const double scan = Median(baseline + "/" + std::to_string(count)) / static_cast<double>(count);
            const double strings = Median(allocating + "/" + std::to_string(count)) / static_cast<double>(count);
            if (unpack <= 0 || scan <= 0 || strings <= 0) {
                continue;
            }
            char line[160];
            std::snprintf(line, sizeof line, "  %8lld  %10.1f  %10.1f  %14.2f  %13.1f  %22.2f\n",
                          static_cast<long long>(count), unpack, scan, unpack / scan, strings, unpack / strings);
            out << line;
            first = count == sizes[1] ? unpack : first;
            last = count == sizes[2] ? unpack : last;
        }
        if (first > 0 && last > 0) {
            char line[128];
            std::snprintf(line, sizeof line, "Unpack per element at %lld / at %lld: %.2f (flat is 1)\n",
                          static_cast<long long>(sizes[2]), static_cast<long long>(sizes[1]), last / first);
            out << line;
        }
    }
};

}  // namespace

int main(int argc, char** argv) {
    return tav::bench::RunWithClient<Client, RatioReporter>(argc, argv, TheClient, [](Client&) {
        for (const std::int64_t count : kNameSizes) {
            benchmark::RegisterBenchmark("UnpackSystemNameList", UnpackNames)->Arg(count);
            benchmark::RegisterBenchmark("ScanNamesOnly", ScanNamesOnly)->Arg(count);
            benchmark::RegisterBenchmark("ScanAndAllocateNames", ScanAndAllocateNames)->Arg(count);
        }
        for (const std::int64_t count : kDeviceSizes) {
            benchmark::RegisterBenchmark("UnpackStorageDevices2", UnpackDevices)->Arg(count);
            benchmark::RegisterBenchmark("ScanDevicesOnly", ScanDevicesOnly)->Arg(count);
            benchmark::RegisterBenchmark("ScanAndAllocateDevices", ScanAndAllocateDevices)->Arg(count);
        }
    });
}
