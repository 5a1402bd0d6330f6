// Scan against the C library's sscanf on the same ASCII text: random formats
// of the directives the decoders use, inputs that mostly match them (blanks,
// signs, 32- and 64-bit edges, dangling exponents, truncation, mismatches).
// Return value and every target must agree.
#include <gtest/gtest.h>

#include <cmath>
#include <cstring>
#include <random>
#include <string>
#include <vector>

#include "core/text/scan.h"
#include "text_test_util.h"

namespace tav::text::test {
namespace {

using detail::ScanTargetKind;

// Where long has 32 bits the C side reads into long long, so that it also
// saturates at the 64-bit limits before we keep the low 32 bits.
constexpr bool kCLongLong = sizeof(long) != 8;
constexpr std::size_t kRoom = 512;
constexpr std::size_t kMaxFields = 8;

struct Field {
    ScanTargetKind kind;
    bool cLongLong;  // the C side stores a long long here
};

struct Case {
    std::string ours, theirs, input;
    std::vector<Field> fields;
};

const std::vector<std::string> kNumbers = {
    "0", "-1", "+5", "-0", "-", "+", "+-5", "a1", "000000000000000000000012", "2147483647", "-2147483648",
    "4294967295", "2147483648", "-2147483649", "4294967296", "-4294967296", "9223372036854775807",
    "9223372036854775808", "-9223372036854775809", "18446744073709551615", "18446744073709551616",
    "-18446744073709551616", "99999999999999999999999"};
const std::vector<std::string> kFloats = {
    "inf", "-INF", "+Infinity", "infin", "in", "nan", "-NaN", "na", "1e", "1e+", "1E-", "1.e5", ".5", ".", "-.",
    "e5", "1.5.6", "1e5e5", "+.0e-0", "1e309", "-1e309", "4e-320", "1e-400", "2.4703282292062327e-324",
    "2.4703282292062328e-324", "1.7976931348623159e308", "0.1000000000000000055511151231257827021181583404541015625",
    "1e99999999999999999999"};

class Generator {
public:
    explicit Generator(std::uint32_t seed) : rng_(seed) {}

    Case Next() {
        Case c;
        for (int items = Int(1, 6); items > 0; --items) {
            Add(c);
        }
        if (Chance(15)) {
            c.input.resize(static_cast<std::size_t>(Int(0, static_cast<int>(c.input.size()))));
        }
        return c;
    }

private:
    int Int(int lo, int hi) { return std::uniform_int_distribution<int>(lo, hi)(rng_); }
    bool Chance(int percent) { return Int(1, 100) <= percent; }
    char Pick(const char* from) { return from[Int(0, static_cast<int>(std::strlen(from)) - 1)]; }
    std::string Pick(const std::vector<std::string>& from) { return from[Int(0, static_cast<int>(from.size()) - 1)]; }
    std::string Run(const char* from, int lo, int hi) {
        std::string s;
        for (int n = Int(lo, hi); n > 0; --n) {
            s += Pick(from);
        }
        return s;
    }
    std::string Blanks() { return Chance(40) ? Run(" \t\n", 0, 3) : ""; }
    std::string Width(int max) { return Chance(35) ? std::to_string(Int(1, max)) : ""; }

    std::string Float() {
        if (Chance(35)) {
            return Pick(kFloats);
        }
        std::string s = Chance(30) ? "-" : "";
        s += Chance(85) ? Run("0123456789", 1, Chance(10) ? 40 : 8) : "";
        s += Chance(50) ? "." + Run("0123456789", 0, 8) : "";
        s += Chance(40) ? std::string(1, Pick("eE")) + Run("+-", 0, 1) + Run("0123456789", 0, 3) : "";
        return s;
    }

    // A '^' or ']' in first place means something else, hence the care.
    std::string Set() {
        std::string s = Chance(30) ? "^" : "";
        s += Chance(15) ? "]" : Chance(10) ? "-" : "";
        for (int n = Int(1, 4); n > 0; --n) {
            s += Chance(25) ? Pick({"a-c", "0-9", "c-a", "9-0", "--/", "+--"})
                            : std::string(1, Pick(s.empty() ? "abc;\" 019-_\t" : "abc;\" 019^-_\t"));
        }
        return s;
    }

    // No 'x' anywhere: glibc reads "0x..." as a hexadecimal double, Scan not.
    void Add(Case& c) {
        const std::string star = Chance(8) ? "*" : "";
        const auto field = [&](const std::string& ours, const std::string& theirs, ScanTargetKind kind,
                               const std::string& input) {
            c.ours += "%" + star + ours;
            c.theirs += "%" + star + theirs;
            c.input += input;
            if (star.empty()) {
                c.fields.push_back({kind, theirs.find("ll") != std::string::npos});
            }
        };
        switch (Int(0, 9)) {
        case 0:
        case 1: {
            const std::string literal = Run("-_abcAB;:,.=\"[]^/019", 1, 3);
            c.ours += literal;
            c.theirs += literal;
            c.input += Chance(90) ? literal : Run("-_abc;:,.019", 1, 3);
            break;
        }
        case 2: {
            const std::string blanks = Pick({" ", "\t", " \t"});
            c.ours += blanks;
            c.theirs += blanks;
            c.input += Run(" \t\n", 0, 3);
            break;
        }
        case 3: {
            const std::string w = Width(12);
            const std::string conversion = Chance(50) ? "d" : "u";
            const std::string number = Chance(40) ? std::to_string(Int(-99999, 99999)) : Pick(kNumbers);
            field(w + (Chance(50) ? "l" : "") + conversion, w + (kCLongLong ? "ll" : "") + conversion,
                  ScanTargetKind::Int32, Blanks() + number);
            break;
        }
        case 4: {
            const std::string s = Width(20) + "s";
            field(s, s, ScanTargetKind::Chars, Blanks() + Run("abcyzAZ0189-;:,.\"[]^_=", 1, 15));
            break;
        }
        case 5: {
            const std::string s = Width(20) + "[" + Set() + "]";
            field(s, s, ScanTargetKind::Chars, Run("abcz;\" 0195-]^_AZ/\t,+", 0, 12));
            break;
        }
        case 6:
            field(Chance(20) ? "1c" : "c", "c", ScanTargetKind::Char, std::string(1, Pick(" \tab;0-\"")));
            break;
        case 7: {
            const std::string s = Width(12) + "lf";
            field(s, s, ScanTargetKind::Double, Blanks() + Float());
            break;
        }
        case 8:
            field("n", "n", ScanTargetKind::Int32, "");
            break;
        default:
            c.ours += "%%";
            c.theirs += "%%";
            c.input += Blanks() + "%";
            break;
        }
    }

    std::mt19937 rng_;
};

// Both sides start from the same filler; a target left alone keeps it.
union Slot {
    long long wide;
    int narrow;
    unsigned char byte;
    double real;
    char text[kRoom];
};

struct OurSlot {
    std::uint32_t integer;
    double real;
    OLECHAR unit;
    OLECHAR text[kRoom];
};

constexpr unsigned char kFill = 0xA5;

std::string Differences(const Case& c) {
    Slot theirs[kMaxFields];
    OurSlot ours[kMaxFields];
    std::memset(theirs, kFill, sizeof theirs);
    std::memset(ours, kFill, sizeof ours);
    std::vector<detail::ScanTarget> targets;
    for (std::size_t i = 0; i < c.fields.size(); ++i) {
        void* const where[] = {&ours[i].integer, &ours[i].real, &ours[i].unit, ours[i].text};
        targets.push_back({c.fields[i].kind, where[static_cast<int>(c.fields[i].kind)], kRoom});
    }
    const int ourResult = detail::ScanTargets(W(c.input), W(c.ours), targets);
    const int theirResult = std::sscanf(c.input.c_str(), c.theirs.c_str(), &theirs[0], &theirs[1], &theirs[2],
                                        &theirs[3], &theirs[4], &theirs[5], &theirs[6], &theirs[7]);
    std::string diff = ourResult == theirResult ? "" : " result " + std::to_string(ourResult) + " vs " +
                                                           std::to_string(theirResult);
    for (std::size_t i = 0; i < c.fields.size(); ++i) {
        const Slot& t = theirs[i];
        const OurSlot& o = ours[i];
        bool same = false;
        switch (c.fields[i].kind) {
        case ScanTargetKind::Int32:
            same = o.integer == static_cast<std::uint32_t>(c.fields[i].cLongLong ? t.wide : t.narrow);
            break;
        case ScanTargetKind::Double:
            // MinGW's sscanf may miss the nearest double by one unit in the
            // last place; its strtod, like Scan, does not.
            same = std::memcmp(&o.real, &t.real, sizeof(double)) == 0 ||
                   (kMingwStdio && (o.real == std::nextafter(t.real, HUGE_VAL) ||
                                    o.real == std::nextafter(t.real, -HUGE_VAL)));
            break;
        case ScanTargetKind::Char:
            same = t.byte == kFill ? o.unit == OLECHAR{0xA5A5} : o.unit == t.byte;
            break;
        case ScanTargetKind::Chars:
            same = static_cast<unsigned char>(t.text[0]) == kFill ? o.text[0] == OLECHAR{0xA5A5} : N(o.text) == t.text;
            break;
        }
        diff += same ? "" : " field " + std::to_string(i);
    }
    return diff.empty() ? diff : "format \"" + c.ours + "\" input \"" + c.input + "\":" + diff;
}

TEST(ScanDifferential, AgreesWithTheCLibrary) {
    if (!kGlibc && !kMingwStdio) {
        GTEST_SKIP() << "no trusted sscanf here: this C library reads overflow, EOF and scan sets its own way";
    }
    Generator generator(1);
    int failures = 0;
    for (int i = 0; i < 40000 && failures < 20; ++i) {
        const Case c = generator.Next();
        const std::string diff = c.fields.size() <= kMaxFields ? Differences(c) : "";
        if (!diff.empty()) {
            ++failures;
            ADD_FAILURE() << diff;
        }
    }
}

}  // namespace
}  // namespace tav::text::test
