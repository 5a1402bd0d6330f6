// The compiled scanner against the run-time one (itself checked against the
// C library): the reply grammars of the decoders, each on its valid reply and
// on mutations of it (cut short, characters replaced, blanks inserted or
// removed), must give the same result and the same targets.
#include <gtest/gtest.h>

#include <array>
#include <cstring>
#include <functional>
#include <random>
#include <string>
#include <vector>

#include "core/text/scan.h"
#include "text_test_util.h"

namespace tav::text::test {
namespace {

// Targets of every kind, compared as bytes after both scans; string buffers
// are pre-filled so that a write past the terminator would show.
struct Targets {
    std::array<std::uint32_t, 8> numbers;
    std::array<double, 2> reals;
    OLECHAR character;
    std::array<std::array<OLECHAR, 48>, 8> texts;

    Targets() {
        numbers.fill(0xA5A5A5A5);
        reals.fill(-7.25);
        character = u'#';
        for (auto& text : texts) {
            text.fill(u'~');
        }
    }
    bool operator==(const Targets& other) const {
        return numbers == other.numbers && std::memcmp(reals.data(), other.reals.data(), sizeof reals) == 0 &&
               character == other.character && texts == other.texts;
    }
};

struct Grammar {
    const char* name;
    const char* valid;
    // Scans `input` with the grammar compiled (compiled = true) or read at
    // run time, into targets.
    std::function<int(OleStringView input, bool compiled, Targets& t)> scan;
};

// One grammar: the same format text for both scanners, the same targets.
#define TAV_GRAMMAR(name, format, valid, ...)                                                    \
    Grammar {                                                                                    \
        name, valid, [](OleStringView in, bool compiled, Targets& t) {                           \
            auto& n = t.numbers;                                                                 \
            auto& r = t.reals;                                                                   \
            auto& s = t.texts;                                                                   \
            (void)n, (void)r, (void)s;                                                           \
            return compiled ? Scan<OLESTR(format)>(in, __VA_ARGS__) : Scan(in, OLESTR(format), __VA_ARGS__); \
        }                                                                                        \
    }

template <std::size_t N>
std::span<OLECHAR> Room(std::array<OLECHAR, 48>& buffer) {
    return std::span<OLECHAR>(buffer.data(), N);
}

const Grammar kGrammars[] = {
    TAV_GRAMMAR("time_t", "-time_t %lu", "-time_t 1700000000", &n[0]),
    TAV_GRAMMAR("quoted", "-Name \"%40[^\"]", "-Name \"cell 7\"", Room<41>(s[0])),
    TAV_GRAMMAR("auto_head", "-auto_ch %d -noelts %d\t%n", "-auto_ch 1 -noelts 12\tBlk;1;7\t", &n[0], &n[1],
                &n[2]),
    TAV_GRAMMAR("auto_element", "%10[^;];%d;%lu\t%n", "RunMode;0;4294967295\tBlk;1;2\t", Room<11>(s[0]), &n[0],
                &n[1], &n[2]),
    TAV_GRAMMAR("device2", "%30[^;];%20[^;];%d;%d;%d\t%n", "HD0a;Fixed;1;0;1\tUSB1;Removable;1;1;1\t",
                Room<31>(s[0]), Room<21>(s[1]), &n[0], &n[1], &n[2], &n[3]),
    TAV_GRAMMAR("slot_head", "-noelts,all,mark,cc %ld,%ld,%lu,%lu\t%n", "-noelts,all,mark,cc 3,1,0,7\tx", &n[0],
                &n[1], &n[2], &n[3], &n[4]),
    TAV_GRAMMAR("array_head", "-%s %d[%n", "-axes 6[1.5,2,-3e2,", Room<41>(s[0]), &n[0], &n[1]),
    TAV_GRAMMAR("array_element", "%lf,%n", "-1234.5625e-3,17.25,", &r[0], &n[0]),
    TAV_GRAMMAR("flag", "%c%n", "10", &t.character, &n[0]),
    TAV_GRAMMAR("address", "%lu.%lu.%lu.%lu", "192.168.100.254", &n[0], &n[1], &n[2], &n[3]),
    TAV_GRAMMAR("suppressed", "-a %*d -b %*s -c %*[^;];%d %%", "-a 12 -b word -c x y;5 %", &n[0]),
    TAV_GRAMMAR("lan", "-Method %9s -Address %19s -Submask %19s -Gateway %19s",
                "-Method FIXIP -Address 10.0.0.5 -Submask 255.0.0.0 -Gateway unspec", Room<10>(s[0]),
                Room<20>(s[1]), Room<20>(s[2]), Room<20>(s[3])),
    TAV_GRAMMAR("camera_tail", "-cameraIdx %d -macAddress\"%40s  -Status \"%20s  -username \"%40[^\"]",
                "-cameraIdx 2 -macAddress\"00:1A\" -Status \"Running\" -username \"op\"", &n[0], Room<41>(s[0]),
                Room<21>(s[1]), Room<41>(s[2])),
};

#undef TAV_GRAMMAR

// Mutations of a valid reply: what a controller, a cut transfer or a
// corrupted buffer might deliver instead.
std::vector<std::string> Mutations(const std::string& valid, std::uint32_t seed) {
    std::vector<std::string> out{valid, ""};
    for (std::size_t cut = 0; cut < valid.size(); ++cut) {
        out.push_back(valid.substr(0, cut));
    }
    std::mt19937 rng(seed);
    const std::string alphabet = " \t\"-;,.[]%01239aZ";
    for (int i = 0; i < 300; ++i) {
        std::string m = valid;
        for (int edits = 1 + static_cast<int>(rng() % 3); edits > 0 && !m.empty(); --edits) {
            const std::size_t at = rng() % m.size();
            const char c = alphabet[rng() % alphabet.size()];
            switch (rng() % 3) {
            case 0: m[at] = c; break;
            case 1: m.insert(m.begin() + static_cast<std::ptrdiff_t>(at), c); break;
            default: m.erase(at, 1); break;
            }
        }
        out.push_back(m);
    }
    out.push_back(valid + std::string(1, '\0') + "tail");
    return out;
}

TEST(CompiledScan, ReadsEveryReplyAsTheRuntimeScannerDoes) {
    std::uint32_t seed = 1;
    for (const Grammar& grammar : kGrammars) {
        Targets valid;
        EXPECT_GT(grammar.scan(W(grammar.valid), true, valid), 0) << grammar.name << ": the valid reply fails";
        for (const std::string& input : Mutations(grammar.valid, seed++)) {
            const OleString wide = W(input);
            Targets compiled;
            Targets runtime;
            const int compiledResult = grammar.scan(wide, true, compiled);
            const int runtimeResult = grammar.scan(wide, false, runtime);
            ASSERT_EQ(compiledResult, runtimeResult) << grammar.name << " on \"" << input << "\"";
            ASSERT_TRUE(compiled == runtime) << grammar.name << " on \"" << input << "\"";
        }
    }
}

TEST(CompiledScan, DescribesItsFields) {
    constexpr auto fields = kScanFields<OLESTR("-%s %d[%n -x %*d %40[^\"] %lf %c %u")>;
    static_assert(fields.size() == 7);
    static_assert(fields[0].kind == FieldKind::Chars && fields[0].width == 0);
    static_assert(fields[1].kind == FieldKind::Signed);
    static_assert(fields[2].kind == FieldKind::Count);
    static_assert(fields[3].kind == FieldKind::Chars && fields[3].width == 40);
    static_assert(fields[4].kind == FieldKind::Double);
    static_assert(fields[5].kind == FieldKind::Char);
    static_assert(fields[6].kind == FieldKind::Unsigned);
}

TEST(CompiledScan, StringFieldStopsAtTheSpansCapacity) {
    std::array<OLECHAR, 48> buffer{};
    // %s without a width is bounded by the span only.
    EXPECT_EQ(Scan<OLESTR("-w %s")>(W("-w abcdef"), std::span<OLECHAR>(buffer.data(), 6)), 0);
    EXPECT_EQ(Scan<OLESTR("-w %s")>(W("-w abcde"), std::span<OLECHAR>(buffer.data(), 6)), 1);
    EXPECT_EQ(N(buffer.data()), "abcde");
}

}  // namespace
}  // namespace tav::text::test
