// ITavEnumBSTR::Sort (ascending, case-sensitive) on an enumerator made by
// UnpackSystemNameList, against std::sort on the same names with the same
// comparison, at 1,000 and 100,000 names. Both start every iteration from
// the same shuffled order, restored outside the timing.
//
// Sort is a fixed network of compare-exchange steps, so the number of
// comparisons depends on the count alone. The comparisons are counted where
// they happen (the link wraps the string comparison both sides call) and
// checked, before anything is timed, against the network's formula: per pass
// the number of i below N - d with (i AND p) = r, and for a power of two,
// N = 2^k, Knuth's closed form (k^2 - k + 4) 2^(k-2) - 1. The pairs themselves
// are checked by the mode that exchanges every pair it compares: the
// enumerator's result must be the permutation that the network, written here
// again from its description, gives.
#include <benchmark/benchmark.h>

#include <algorithm>
#include <cstdint>
#include <cstdio>
#include <map>
#include <numeric>
#include <random>
#include <string>
#include <vector>

#include "TavController.h"
#include "bench_support.h"
#include "core/bstr_order.h"
#include "core/text/format.h"
#include "tav/bstr.h"
#include "tav/com_ptr.h"
#include "tav/variant.h"

// Every call of the comparison, from the enumerator and from the baseline
// alike; the link routes them through here (-Wl,--wrap, bench/CMakeLists.txt).
namespace {
std::uint64_t Comparisons = 0;
}

extern "C" bool __real__ZN3tav14BstrOutOfOrderEPKDsS1_i(const OLECHAR* a, const OLECHAR* b, LONG mode) noexcept;

extern "C" bool __wrap__ZN3tav14BstrOutOfOrderEPKDsS1_i(const OLECHAR* a, const OLECHAR* b, LONG mode) noexcept {
    ++Comparisons;
    return __real__ZN3tav14BstrOutOfOrderEPKDsS1_i(a, b, mode);
}

namespace {

using tav::Bstr;
using tav::ComPtr;
using tav::OleString;
using tav::OleStringView;

constexpr std::int64_t kSizes[] = {1'000, 100'000};
// Counted once each, not timed: the closed form holds for powers of two.
constexpr std::int64_t kPowersOfTwo[] = {1'024, 131'072};
// No mode of the table: every compared pair is exchanged.
constexpr LONG kExchangeAll = 99;

class Client : public tav::bench::Client {
public:
    Client() {
        if (Failure() == nullptr && FAILED(QueryTo(Controller(), boot_))) {
            Fail("cannot reach the controller's ITavBoot");
        }
    }
    ITavBoot* Boot() const { return boot_.Get(); }

private:
    ComPtr<ITavBoot> boot_;
};

Client* TheClient = nullptr;

// count distinct system names as a cell has them, in a fixed shuffled order.
std::vector<OleString> NamesOf(std::int64_t count) {
    static constexpr const OLECHAR* kPrefixes[] = {OLESTR("Cell"), OLESTR("Line_"), OLESTR("Station"),
                                                   OLESTR("WeldCell"), OLESTR("PaintLine")};
    std::vector<std::uint32_t> numbers(static_cast<size_t>(count));
    std::iota(numbers.begin(), numbers.end(), 0u);
    std::mt19937 random(20240611u);
    std::shuffle(numbers.begin(), numbers.end(), random);
    std::vector<OleString> names;
    names.reserve(numbers.size());
    for (const std::uint32_t number : numbers) {
        names.push_back(tav::text::Format(OLESTR("%s%u_RW6"), kPrefixes[number % 5], number * 7919u % 1'000'003u));
    }
    return names;
}

const tav::Variant& ReplyWith(std::int64_t count) {
    static std::map<std::int64_t, tav::Variant> replies;
    tav::Variant& reply = replies[count];
    if (reply.Type() != VT_BSTR) {
        OleString text = tav::text::Format(OLESTR("-NoOfElements %d -Names "), count);
        for (const OleString& name : NamesOf(count)) {
            text += name;
            text += u',';
        }
        reply.SetBstr(Bstr(text));
    }
    return reply;
}

// A new enumerator over the names in their shuffled order; null on failure.
ComPtr<ITavEnumBSTR> Unpacked(std::int64_t count) {
    TavRetrievalParams retrieval{};
    ComPtr<ITavEnumBSTR> names;
    if (FAILED(TheClient->Boot()->UnpackSystemNameList(const_cast<VARIANT*>(ReplyWith(count).Get()), &retrieval,
                                                         &names)) ||
        retrieval.noOfElts != count) {
        return nullptr;
    }
    return names;
}

// Everything the enumerator hands out from the start.
std::vector<OleString> Drain(ITavEnumBSTR* names) {
    std::vector<OleString> all;
    names->Reset();
    BSTR batch[256];
    ULONG fetched = 0;
    do {
        if (FAILED(names->RemNext(256, batch, &fetched))) {
            return {};
        }
        for (ULONG i = 0; i < fetched; ++i) {
            all.emplace_back(tav::ViewOf(batch[i]));
            SysFreeString(batch[i]);
        }
    } while (fetched == 256);
    return all;
}

bool Before(BSTR a, BSTR b) noexcept { return tav::BstrOutOfOrder(b, a, tav::bstr_sort::kAscending); }

// The network from its description (Knuth, Algorithm 5.2.2M, steps M1 to
// M5), exchanging every pair it compares; the number of comparisons.
std::uint64_t ExchangeAll(std::vector<std::size_t>& items) {
    const std::size_t n = items.size();
    std::uint64_t compared = 0;
    if (n < 2) {
        return 0;
    }
    std::size_t t = 0;
    while ((std::size_t{1} << t) < n) {
        ++t;
    }
    for (std::size_t p = std::size_t{1} << (t - 1); p > 0; p >>= 1) {
        std::size_t q = std::size_t{1} << (t - 1);
        std::size_t r = 0;
        std::size_t d = p;
        while (true) {
            for (std::size_t i = 0; i + d < n; ++i) {
                if ((i & p) == r) {
                    ++compared;
                    std::swap(items[i], items[i + d]);
                }
            }
            if (q == p) {
                break;
            }
            d = q - p;
            q >>= 1;
            r = p;
        }
    }
    return compared;
}

// The network's comparisons counted per pass, without running it: in each
// pass, the i below n - d whose bit p is clear (r = 0) or set (r = p).
std::uint64_t NetworkComparisons(std::uint64_t n) {
    if (n < 2) {
        return 0;
    }
    std::uint64_t t = 0;
    while ((std::uint64_t{1} << t) < n) {
        ++t;
    }
    std::uint64_t total = 0;
    for (std::uint64_t p = std::uint64_t{1} << (t - 1); p > 0; p >>= 1) {
        std::uint64_t q = std::uint64_t{1} << (t - 1);
        std::uint64_t r = 0;
        std::uint64_t d = p;
        while (true) {
            if (d < n) {
                const std::uint64_t m = n - d;
                const std::uint64_t whole = m / (2 * p) * p;
                const std::uint64_t part = m % (2 * p);
                total += whole + (r == 0 ? std::min(part, p) : (part > p ? part - p : 0));
            }
            if (q == p) {
                break;
            }
            d = q - p;
            q >>= 1;
            r = p;
        }
    }
    return total;
}

std::uint64_t ClosedForm(std::uint64_t k) { return ((k * k - k + 4) << k) / 4 - 1; }

struct Count {
    std::uint64_t sort = 0;
    std::uint64_t formula = 0;
    std::uint64_t stdSort = 0;
};
std::map<std::int64_t, Count> Counts;

// Sort's comparisons on a fresh enumerator of count names.
std::uint64_t CountedSort(std::int64_t count, LONG mode) {
    ComPtr<ITavEnumBSTR> names = Unpacked(count);
    if (!names) {
        return 0;
    }
    Comparisons = 0;
    names->Sort(mode);
    return Comparisons;
}

// Null when the enumerator sorts as std::sort does, compares exactly the
// network's pairs and as often as the formula says; else what differs.
const char* SortAgrees(std::int64_t count) {
    ComPtr<ITavEnumBSTR> names = Unpacked(count);
    if (!names) {
        return "UnpackSystemNameList refuses the list";
    }
    std::vector<OleString> original = Drain(names.Get());
    Comparisons = 0;
    names->Sort(tav::bstr_sort::kAscending);
    Count& counted = Counts[count];
    counted.sort = Comparisons;
    counted.formula = NetworkComparisons(static_cast<std::uint64_t>(count));
    if (counted.sort == 0) {
        return "the comparisons are not counted (the link does not wrap BstrOutOfOrder)";
    }
    if (counted.sort != counted.formula) {
        return "Sort does not make as many comparisons as the network";
    }

    std::vector<Bstr> copies;
    std::vector<BSTR> expected;
    for (const OleString& name : original) {
        copies.emplace_back(name);
        expected.push_back(copies.back().Get());
    }
    Comparisons = 0;
    std::sort(expected.begin(), expected.end(), Before);
    counted.stdSort = Comparisons;
    const std::vector<OleString> sorted = Drain(names.Get());
    if (sorted.size() != expected.size() ||
        !std::equal(sorted.begin(), sorted.end(), expected.begin(),
                    [](const OleString& a, BSTR b) { return OleStringView(a) == tav::ViewOf(b); })) {
        return "Sort does not give std::sort's order";
    }

    ComPtr<ITavEnumBSTR> scrambled = Unpacked(count);
    scrambled->Sort(kExchangeAll);
    std::vector<std::size_t> order(original.size());
    std::iota(order.begin(), order.end(), std::size_t{0});
    ExchangeAll(order);
    const std::vector<OleString> exchanged = Drain(scrambled.Get());
    for (std::size_t i = 0; i < order.size(); ++i) {
        if (exchanged.size() != order.size() || exchanged[i] != original[order[i]]) {
            return "Sort does not compare the network's pairs";
        }
    }
    return nullptr;
}

void Sort(benchmark::State& state) {
    const std::int64_t count = state.range(0);
    if (TheClient->Failure() != nullptr) {
        state.SkipWithError(TheClient->Failure());
        return;
    }
    if (const char* why = SortAgrees(count)) {
        state.SkipWithError(why);
        return;
    }
    ComPtr<ITavEnumBSTR> pristine = Unpacked(count);
    for (auto _ : state) {
        state.PauseTiming();
        ITavEnumBSTR* names = nullptr;
        pristine->Clone(&names);
        state.ResumeTiming();
        benchmark::DoNotOptimize(names->Sort(tav::bstr_sort::kAscending));
        state.PauseTiming();
        names->Release();
        state.ResumeTiming();
    }
    state.SetItemsProcessed(state.iterations() * count);
}

void StdSort(benchmark::State& state) {
    const std::int64_t count = state.range(0);
    std::vector<Bstr> names;
    for (const OleString& name : NamesOf(count)) {
        names.emplace_back(name);
    }
    std::vector<BSTR> shuffled;
    for (const Bstr& name : names) {
        shuffled.push_back(name.Get());
    }
    std::vector<BSTR> items(shuffled.size());
    for (auto _ : state) {
        state.PauseTiming();
        std::copy(shuffled.begin(), shuffled.end(), items.begin());
        state.ResumeTiming();
        std::sort(items.begin(), items.end(), Before);
        benchmark::ClobberMemory();
    }
    state.SetItemsProcessed(state.iterations() * count);
}

// Null when the counts at powers of two match Knuth's closed form.
const char* ClosedFormHolds() {
    for (const std::int64_t count : kPowersOfTwo) {
        std::uint64_t k = 0;
        while ((std::int64_t{1} << k) < count) {
            ++k;
        }
        const std::uint64_t counted = CountedSort(count, tav::bstr_sort::kAscending);
        if (counted != ClosedForm(k) || NetworkComparisons(static_cast<std::uint64_t>(count)) != ClosedForm(k)) {
            return "Sort's comparisons at a power of two differ from (k^2 - k + 4) 2^(k-2) - 1";
        }
        Counts[count] = {counted, ClosedForm(k), 0};
    }
    return nullptr;
}

class RatioReporter : public tav::bench::MedianReporter {
public:
    void Finalize() override {
        ConsoleReporter::Finalize();
        std::ostream& out = GetOutputStream();
        out << "\nComparisons, counted as they are made (before timing):\n"
            << "     names          Sort   network formula      std::sort\n";
        for (const auto& [count, counted] : Counts) {
            char line[160];
            std::snprintf(line, sizeof line, "  %8lld  %12llu  %16llu  %13llu\n", static_cast<long long>(count),
                          static_cast<unsigned long long>(counted.sort),
                          static_cast<unsigned long long>(counted.formula),
                          static_cast<unsigned long long>(counted.stdSort));
            out << line;
        }
        out << "\nITavEnumBSTR::Sort against std::sort, same names, same comparison, CPU time, same process:\n"
            << "     names     Sort (us)   std::sort (us)   Sort/std::sort\n";
        for (const std::int64_t count : kSizes) {
            const double sort = Median("ITavEnumBSTR::Sort/" + std::to_string(count));
            const double baseline = Median("std::sort/" + std::to_string(count));
            if (sort <= 0 || baseline <= 0) {
                continue;
            }
            char line[160];
            std::snprintf(line, sizeof line, "  %8lld  %12.1f  %15.1f  %15.2f\n", static_cast<long long>(count),
                          sort, baseline, sort / baseline);
            out << line;
        }
    }
};

}  // namespace

int main(int argc, char** argv) {
    return tav::bench::RunWithClient<Client, RatioReporter>(argc, argv, TheClient, [](Client& client) {
        if (client.Failure() == nullptr) {
            if (const char* why = ClosedFormHolds()) {
                client.Fail(why);
            }
        }
        for (const std::int64_t count : kSizes) {
            benchmark::RegisterBenchmark("ITavEnumBSTR::Sort", Sort)->Arg(count)->Unit(benchmark::kMicrosecond);
            benchmark::RegisterBenchmark("std::sort", StdSort)->Arg(count)->Unit(benchmark::kMicrosecond);
        }
    });
}
