// UnpackCameraInfo2 (ITavLumeret2, 19 out-values: 15 strings, two flags, the
// index and the status) against scanning its grammar alone: the same
// compiled format with every string field read in place, nothing allocated;
// and, for where the time goes, that scan with the strings allocated.
// The reply is built once, outside the timed loop; the caller's strings are
// freed inside it, as a client frees them.
#include <benchmark/benchmark.h>

#include <array>
#include <cstdio>

#include "TavController.h"
#include "bench_support.h"
#include "core/text/scan.h"
#include "tav/bstr.h"
#include "tav/com_ptr.h"
#include "tav/variant.h"

namespace {

using tav::Bstr;
using tav::ComPtr;
using tav::OleStringView;
using tav::text::FieldView;

// The controller's grammar, kept with its irregular blanks.
constexpr tav::text::ScanFormat kGrammar(OLESTR(
    "-currIPAddress \"%40s -currSubnetMask \"%40s -currDefaultGateway \"%40s -currHostName \"%40s "
    "-currDNSServer\"%40s -currDNSSuffix \"%40s -currIsDHCPEnabled %d -confIPAddress \"%40s "
    "-confSubnetMask \"%40s -confDefaultGateway \"%40s -confHostName \"%40s -confDNSServer \"%40s "
    "-ConfDNSSuffix \"%40s -confIsDHCPEnabled %d -confCameraName \"%40s -cameraIdx %d "
    "-macAddress\"%40s  -Status \"%20s  -username \"%40[^\"]"));

// A camera as the controller describes it; the values close with their
// quote, which the %40s fields keep.
constexpr const OLECHAR* kReply = OLESTR(
    "-currIPAddress \"192.168.125.41\" -currSubnetMask \"255.255.255.0\" -currDefaultGateway \"192.168.125.1\" "
    "-currHostName \"cam-east-weld-01\" -currDNSServer\"192.168.125.2\" -currDNSSuffix \"cell7.plant.local\" "
    "-currIsDHCPEnabled 0 -confIPAddress \"192.168.125.41\" -confSubnetMask \"255.255.255.0\" "
    "-confDefaultGateway \"192.168.125.1\" -confHostName \"cam-east-weld-01\" -confDNSServer \"192.168.125.2\" "
    "-ConfDNSSuffix \"cell7.plant.local\" -confIsDHCPEnabled 1 -confCameraName \"EastWeldSeam\" -cameraIdx 2 "
    "-macAddress\"00:1A:2B:3C:4D:5E\"  -Status \"Running  -username \"vision_operator\"");

// ITavLumeret2 comes with the twelfth class; the last one answers all.
class Client : public tav::bench::Client {
public:
    Client() : tav::bench::Client(CLSID_TavController17) {
        if (Failure() == nullptr && FAILED(QueryTo(Controller(), cameras_))) {
            Fail("cannot reach the controller's ITavLumeret2");
        }
    }
    ITavLumeret2* Cameras() const { return cameras_.Get(); }

private:
    ComPtr<ITavLumeret2> cameras_;
};

Client* TheClient = nullptr;

// What the decoder hands out.
struct Info {
    std::array<BSTR, 15> strings{};  // in reply order, the user name last
    LONG currDhcp = 0;
    LONG confDhcp = 0;
    ULONG index = 0;
    TavCameraStatus status{};

    Info() = default;
    Info(const Info&) = delete;
    Info& operator=(const Info&) = delete;
    ~Info() { Free(); }

    void Free() {
        for (BSTR& text : strings) {
            SysFreeString(text);
            text = nullptr;
        }
    }
};

HRESULT Unpack(ITavLumeret2* cameras, VARIANT* reply, Info& o) {
    BSTR* s = o.strings.data();
    return cameras->UnpackCameraInfo2(reply, &s[0], &s[1], &s[2], &s[3], &s[4], &s[5], &o.currDhcp, &s[6], &s[7],
                                      &s[8], &s[9], &s[10], &s[11], &o.confDhcp, &s[12], &o.index, &s[13], &o.status,
                                      &s[14]);
}

// What the scan alone gives.
struct Scanned {
    std::array<OleStringView, 15> strings;
    OleStringView status;
    std::int32_t currDhcp = 0;
    std::int32_t confDhcp = 0;
    std::int32_t index = 0;
};

int ScanOnly(OleStringView text, Scanned& o) {
    OleStringView* s = o.strings.data();
    return tav::text::Scan<kGrammar>(text, FieldView{&s[0]}, FieldView{&s[1]}, FieldView{&s[2]}, FieldView{&s[3]},
                                     FieldView{&s[4]}, FieldView{&s[5]}, &o.currDhcp, FieldView{&s[6]},
                                     FieldView{&s[7]}, FieldView{&s[8]}, FieldView{&s[9]}, FieldView{&s[10]},
                                     FieldView{&s[11]}, &o.confDhcp, FieldView{&s[12]}, &o.index, FieldView{&s[13]},
                                     FieldView{&o.status}, FieldView{&s[14]});
}

const char* DecoderAgrees(VARIANT* reply, OleStringView text) {
    Scanned scanned;
    if (ScanOnly(text, scanned) != 19) {
        return "the grammar does not scan the reply";
    }
    Info info;
    if (FAILED(Unpack(TheClient->Cameras(), reply, info))) {
        return "UnpackCameraInfo2 refuses the reply";
    }
    for (size_t i = 0; i < info.strings.size(); ++i) {
        if (tav::ViewOf(info.strings[i]) != scanned.strings[i]) {
            return "UnpackCameraInfo2 does not give the strings scanned";
        }
    }
    if (info.currDhcp != scanned.currDhcp || info.confDhcp != scanned.confDhcp ||
        info.index != static_cast<ULONG>(scanned.index) || scanned.status != OleStringView(OLESTR("Running")) ||
        info.status != CameraStatus_Running) {
        return "UnpackCameraInfo2 does not give the numbers and status scanned";
    }
    return nullptr;
}

void Subject(benchmark::State& state) {
    if (TheClient->Failure() != nullptr) {
        state.SkipWithError(TheClient->Failure());
        return;
    }
    tav::Variant reply;
    reply.SetBstr(Bstr(kReply));
    if (const char* why = DecoderAgrees(reply.Get(), tav::ViewOf(kReply))) {
        state.SkipWithError(why);
        return;
    }
    ITavLumeret2* cameras = TheClient->Cameras();
    Info info;
    for (auto _ : state) {
        benchmark::DoNotOptimize(Unpack(cameras, reply.Get(), info));
        info.Free();
    }
}

void Baseline(benchmark::State& state) {
    const Bstr text(kReply);
    const OleStringView view = text.View();
    Scanned scanned;
    for (auto _ : state) {
        benchmark::DoNotOptimize(ScanOnly(view, scanned));
        benchmark::ClobberMemory();
    }
}

// The scan and the one thing no decoder of this reply can avoid on top of
// it: a new string for each of the 15 string fields, freed as the caller
// frees it.
void ScanAndAllocate(benchmark::State& state) {
    const Bstr text(kReply);
    const OleStringView view = text.View();
    Scanned scanned;
    std::array<BSTR, 15> strings{};
    for (auto _ : state) {
        benchmark::DoNotOptimize(ScanOnly(view, scanned));
        for (size_t i = 0; i < strings.size(); ++i) {
            strings[i] = SysAllocStringLen(scanned.strings[i].data(), static_cast<UINT>(scanned.strings[i].size()));
        }
        benchmark::DoNotOptimize(strings.data());
        for (BSTR& string : strings) {
            SysFreeString(string);
        }
    }
}

class RatioReporter : public tav::bench::MedianReporter {
public:
    void Finalize() override {
        ConsoleReporter::Finalize();
        const double unpack = Median("UnpackCameraInfo2");
        const double scan = Median("ScanOnly");
        const double allocating = Median("ScanAndAllocate");
        if (unpack <= 0 || scan <= 0 || allocating <= 0) {
            return;
        }
        char line[320];
        std::snprintf(line, sizeof line,
                      "\nUnpackCameraInfo2, CPU time, same process:\n"
                      "  / scanning its grammar alone:              %.2f (%.0f ns / %.0f ns)\n"
                      "  / scanning and its 15 strings allocated:   %.2f (%.0f ns / %.0f ns)\n",
                      unpack / scan, unpack, scan, unpack / allocating, unpack, allocating);
        GetOutputStream() << line;
    }
};

}  // namespace

int main(int argc, char** argv) {
    return tav::bench::RunWithClient<Client, RatioReporter>(argc, argv, TheClient, [](Client&) {
        benchmark::RegisterBenchmark("UnpackCameraInfo2", Subject);
        benchmark::RegisterBenchmark("ScanOnly", Baseline);
        benchmark::RegisterBenchmark("ScanAndAllocate", ScanAndAllocate);
    });
}
