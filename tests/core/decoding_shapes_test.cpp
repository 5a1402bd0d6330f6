// The decoding shapes that many Unpack operations share: out-values checked
// and cleared together, a grammar scanned into typed fields and handed out in
// order, keyed replies, counted arrays and lists into enumerators.
#include <array>
#include <cmath>
#include <map>
#include <set>
#include <string>
#include <span>

#include "core/keyed_text.h"
#include "core/list_decoder.h"
#include "support/controller_test.h"
#include "tav/fault_injection.h"

namespace tav::test {
namespace {

class DecodingShapesTest : public ControllerTest {};

enum Colour { Red = 1, Green = 2 };
constexpr WordValue<Colour> kColours[] = {{OLESTR("red"), Red}, {OLESTR("green"), Green}};

// A decoder of "-name "<text>" -count <n> -colour <word> -code <bounded>"
// with every kind of out-value.
struct Decoded {
    TestBstr name;
    short count = 99;
    Colour colour = static_cast<Colour>(99);
    TestBstr code;
};

HRESULT DecodeSample(ControllerObject& object, VARIANT* data, Decoded& d) {
    BSTR* name = d.name.Out();
    BSTR* code = d.code.Out();
    *name = reinterpret_cast<BSTR>(1);  // cleared by OutPointers before anything is read
    return object.Decode(data)
        .Initialised()
        .NotNull(OLESTR("Sample. NULL"))
        .OutPointers(OLESTR("Sample. Invalid out pointer"), name, &d.count, &d.colour, code)
        .IsBstr(OLESTR("Sample. Not text"))
        .Fields<OLESTR("-name \"%20[^\"]\" -count %d -colour %9s -code %s")>(
            OLESTR("Sample failed."), name, &d.count,
            fields::Mapped<Colour>{&d.colour, kColours, OLESTR("Sample. Unknown colour")},
            fields::Bounded<6>{code});
}

TEST_F(DecodingShapesTest, FieldsAreHandedOutInTheirTypes) {
    ControllerObject* object = Make();
    TestVariant reply = TestVariant::Text("-name \"cell 7\" -count 70000 -colour green -code ab12");
    Decoded d;
    ASSERT_EQ(DecodeSample(*object, reply.Get(), d), S_OK);
    EXPECT_EQ(d.name.Text(), "cell 7");
    EXPECT_EQ(d.count, static_cast<short>(70000)) << "a number is truncated to its out-value as C truncates";
    EXPECT_EQ(d.colour, Green);
    EXPECT_EQ(d.code.Text(), "ab12");
}

// A refused reply leaves every out-value as it was cleared: nothing is
// handed out before the whole reply is known good. Each failure of one
// decoder reports a line of its own.
TEST_F(DecodingShapesTest, RefusedRepliesLeaveEveryOutValueCleared) {
    struct Case {
        const char* reply;
        const char* error;
    };
    const Case cases[] = {
        {"-name \"cell 7\" -count x -colour green -code ab", "Sample failed."},
        {"-name \"cell 7\" -count 1 -colour blue -code ab", "Sample. Unknown colour"},
        {"-name \"cell 7\" -count 1 -colour red -code abcdef", "Sample failed."},  // code: 5 characters at most
        {"-name \"\" -count 1 -colour red -code ab", "Sample failed."},
    };
    ControllerObject* object = Make();
    std::map<std::string, int> lineOfError;
    for (const Case& c : cases) {
        SCOPED_TRACE(c.reply);
        TestVariant reply = TestVariant::Text(c.reply);
        Decoded d;
        EXPECT_EQ(DecodeSample(*object, reply.Get(), d), E_FAIL);
        EXPECT_TRUE(HasError(c.error));
        lineOfError.emplace(c.error, Error().line);
        EXPECT_TRUE(d.name.IsNull());
        EXPECT_TRUE(d.code.IsNull());
        EXPECT_EQ(d.count, 0);
        EXPECT_EQ(d.colour, 0);
    }
    TestVariant number = TestVariant::Number(1);
    Decoded d;
    ASSERT_EQ(DecodeSample(*object, number.Get(), d), E_FAIL);
    EXPECT_TRUE(HasError("Sample. Not text"));
    lineOfError.emplace("Sample. Not text", Error().line);
    std::set<int> lines;
    for (const auto& [error, line] : lineOfError) {
        EXPECT_TRUE(lines.insert(line).second) << "\"" << error << "\" reports another failure's line";
    }
}

TEST_F(DecodingShapesTest, OutPointersAreCheckedTogetherBeforeTheType) {
    ControllerObject* object = Make();
    TestVariant number = TestVariant::Number(5);
    BSTR name = reinterpret_cast<BSTR>(1);
    short count = 5;
    EXPECT_EQ(object->Decode(number.Get())
                  .OutPointers(OLESTR("Sample. Invalid out pointer"), &name, &count, static_cast<BSTR*>(nullptr))
                  .IsBstr(OLESTR("Sample. Not text"))
                  .Result(),
              E_POINTER);
    EXPECT_TRUE(HasError("Sample. Invalid out pointer"));
    EXPECT_EQ(name, reinterpret_cast<BSTR>(1)) << "nothing is cleared when a pointer is missing";
    EXPECT_EQ(count, 5);
}

// When an allocation fails, the strings already handed out stay with the
// caller and the result says so.
TEST_F(DecodingShapesTest, StringsAlreadyHandedOutStayWhenAnAllocationFails) {
    if (!TavFailAllocationAt(0)) {
        GTEST_SKIP() << "allocation failures cannot be injected on this platform";
    }
    ControllerObject* object = Make();
    TestVariant reply = TestVariant::Text("-name \"cell 7\" -count 1 -colour red -code ab");
    Decoded d;
    TavFailAllocationAt(2);  // the name is the first string, the code the second
    EXPECT_EQ(DecodeSample(*object, reply.Get(), d), E_OUTOFMEMORY);
    TavFailAllocationAt(0);
    EXPECT_TRUE(HasError("SysAllocString failed"));
    EXPECT_EQ(d.name.Text(), "cell 7");
    EXPECT_TRUE(d.code.IsNull());
}

TEST(KeyedText, FindsKeysInOrderAndValuesUpToTheirTab) {
    KeyedText text(OLESTR("-a 1\t-b two words\t-a 3\t-c no tab"));
    EXPECT_EQ(text.ValueOf(OLESTR("-b")), OleStringView(OLESTR(" two words")));
    EXPECT_EQ(text.ValueOf(OLESTR("-a")), OleStringView(OLESTR(" 3"))) << "the search goes on after the last value";
    EXPECT_FALSE(text.ValueOf(OLESTR("-b"))) << "nothing before the position is found again";
    const std::size_t before = text.Position();
    EXPECT_FALSE(text.ValueOf(OLESTR("-c"))) << "a value needs its closing tab";
    EXPECT_EQ(text.Position(), before);
    EXPECT_TRUE(text.At(OLESTR("-c")));
    EXPECT_EQ(text.Rest(), OleStringView(OLESTR("-c no tab")));
}

TEST(KeyedText, TheTextEndsAtItsFirstNul) {
    const OLECHAR raw[] = {u'-', u'a', u' ', u'1', u'\t', 0, u'-', u'b', u' ', u'2', u'\t'};
    KeyedText text(OleStringView(raw, std::size(raw)));
    EXPECT_TRUE(text.ValueOf(OLESTR("-a")));
    EXPECT_FALSE(text.ValueOf(OLESTR("-b")));
}

TEST(CountedArrays, ReadUpToTheCapacityAndReportTheWrittenCount) {
    struct Case {
        const char* text;
        std::size_t capacity;
        LONG count;
        std::vector<double> values;
    };
    const Case cases[] = {
        {"-axes 3[1.5,-2,3e2,]", 6, 3, {1.5, -2, 300}},
        {"-axes 8[1,2,3,4,5,6,7,8,]", 6, 8, {1, 2, 3, 4, 5, 6}},
        {"-axes 4[1,2,x,4,]", 6, 4, {1, 2}},
        {"-axes 0[]", 6, 0, {}},
        {"-axes -3[1,]", 6, -3, {}},
        // The head counts two fields before its bracket: without one, the
        // count stands and no element is read.
        {"-axes 2 1,2,", 6, 2, {}},
    };
    for (const Case& c : cases) {
        SCOPED_TRACE(c.text);
        std::array<double, 8> into{};
        const OleString text = Widen(c.text);
        const auto read = ReadNumberArray(text, std::span<double>(into.data(), c.capacity));
        ASSERT_TRUE(read);
        EXPECT_EQ(read->count, c.count);
        ASSERT_EQ(read->stored, c.values.size());
        for (std::size_t i = 0; i < c.values.size(); ++i) {
            EXPECT_EQ(into[i], c.values[i]);
        }
    }
    std::array<double, 2> into{};
    EXPECT_FALSE(ReadNumberArray(Widen("-axes x[1,]"), into));
    EXPECT_FALSE(ReadNumberArray(Widen("axes 2[1,]"), into));
}

TEST(CountedArrays, FlagsAreOneCharacterEach) {
    std::array<LONG, 4> into{9, 9, 9, 9};
    const auto read = ReadFlagArray(Widen("-ssv 5[1021x]"), into);
    ASSERT_TRUE(read);
    EXPECT_EQ(read->count, 5);
    EXPECT_EQ(read->stored, 4u);
    EXPECT_EQ(into, (std::array<LONG, 4>{1, 0, 0, 1}));
}

// A list of "<number>;" elements into the PSC unit records, for the list
// decoder's own rules.
constexpr ListTexts kUnitTexts{OLESTR("Units. No memory"), OLESTR("Units. Bad element: %s"),
                               OLESTR("Units. Can't create"), OLESTR("Units. Can't init"), OLESTR("Units. QI")};

HRESULT DecodeUnits(ControllerObject& object, VARIANT* reply, LONG count, IEnumTavPSCUnits** units,
                    ListShape shape = {.shortestElement = 2}) {
    return object.Decode(reply).Then([&](Reply& r) {
        return DecodeList<PscUnitTraits>(
            r, kUnitTexts, shape, count, r.Text(),
            [](OleStringView rest, TavPSCUnit& unit) {
                std::int32_t consumed = 0;
                if (text::Scan<OLESTR("%lu;%n")>(rest, &unit.PSCUnitID, &consumed) != 1) {
                    return ElementRead::Mismatch();
                }
                return ElementRead::Read(static_cast<std::size_t>(consumed));
            },
            units);
    });
}

HRESULT DecodeUnits(ControllerObject& object, const char* text, LONG count, IEnumTavPSCUnits** units,
                    ListShape shape = {.shortestElement = 2}) {
    TestVariant reply = TestVariant::Text(text);
    return DecodeUnits(object, reply.Get(), count, units, shape);
}

std::vector<ULONG> UnitIds(IEnumTavPSCUnits* units) {
    std::vector<ULONG> ids;
    TavPSCUnit unit{};
    while (units->RemNext(1, &unit, nullptr) == S_OK) {
        ids.push_back(unit.PSCUnitID);
    }
    return ids;
}

TEST_F(DecodingShapesTest, ListsBecomeEnumeratorsOrFailWithTheRestOfTheReply) {
    ControllerObject* object = Make();
    IEnumTavPSCUnits* units = nullptr;
    ASSERT_EQ(DecodeUnits(*object, "1;2;3;", 3, &units), S_OK);
    EXPECT_EQ(UnitIds(units), (std::vector<ULONG>{1, 2, 3}));
    units->Release();

    ASSERT_EQ(DecodeUnits(*object, "", 0, &units), S_OK) << "an empty list";
    EXPECT_TRUE(UnitIds(units).empty());
    units->Release();
    ASSERT_EQ(DecodeUnits(*object, "", -4, &units), S_OK) << "a negative count is an empty list";
    units->Release();

    units = nullptr;
    EXPECT_EQ(DecodeUnits(*object, "1;x;3;", 3, &units), E_FAIL);
    EXPECT_TRUE(HasError("Units. Bad element: x;3;"));
    EXPECT_EQ(units, nullptr);
    EXPECT_EQ(DecodeUnits(*object, "1;2;", 100000000, &units), E_FAIL) << "a count the text cannot hold";
    EXPECT_TRUE(HasError("Units. Bad element: "));
}

// Sizes count in 32 bits: a count whose size does not fit fails as the
// allocation would on the 32-bit target, on every platform alike.
TEST_F(DecodingShapesTest, ACountWhoseSizeOverflows32BitsIsOutOfMemory) {
    ControllerObject* object = Make();
    IEnumTavPSCUnits* units = nullptr;
    EXPECT_EQ(DecodeUnits(*object, "1;", 357913942, &units), E_OUTOFMEMORY);  // 12-byte records
    EXPECT_TRUE(HasError("Units. No memory"));
    EXPECT_EQ(DecodeUnits(*object, "1;", 357913941, &units), E_FAIL);
    EXPECT_TRUE(HasError("Units. Bad element: "));
}

// A list counted in 16 bits never ends by its count above 65535: it reads
// until an element fails.
TEST_F(DecodingShapesTest, ASixteenBitCounterReadsUntilAnElementFails) {
    ControllerObject* object = Make();
    IEnumTavPSCUnits* units = nullptr;
    EXPECT_EQ(DecodeUnits(*object, "1;2;3;", 70000, &units, {.shortestElement = 2, .sixteenBitCounter = true}),
              E_FAIL);
    EXPECT_TRUE(HasError("Units. Bad element: "));
    ASSERT_EQ(DecodeUnits(*object, "1;2;3;", 3, &units, {.shortestElement = 2, .sixteenBitCounter = true}), S_OK);
    units->Release();
}

// Each allocation failing in turn: one of the list's own texts each time,
// no enumerator handed out, nothing left behind (LeakSanitizer checks at exit).
TEST_F(DecodingShapesTest, AllocationFailuresGiveTheListsTexts) {
    if (!TavFailAllocationAt(0)) {
        GTEST_SKIP() << "allocation failures cannot be injected on this platform";
    }
    ControllerObject* object = Make();
    TestVariant reply = TestVariant::Text("1;2;");
    for (const ListOrder order : {ListOrder::ArrayFirst, ListOrder::EnumeratorFirst}) {
        IEnumTavPSCUnits* units = nullptr;
        HRESULT hr = S_OK;
        auto release = [&] {
            if (units != nullptr) {
                units->Release();
                units = nullptr;
            }
        };
        const long failures = ForEachAllocationFailure(
            [&] { hr = DecodeUnits(*object, reply.Get(), 2, &units, {.order = order, .shortestElement = 2}); },
            [&] {
                if (FAILED(hr)) {
                    EXPECT_EQ(units, nullptr);
                    EXPECT_EQ(Error().message.rfind("Units. ", 0), 0u) << Error().message;
                }
                release();
            });
        EXPECT_GE(failures, 1);
        EXPECT_EQ(hr, S_OK);
        release();
    }
}

}  // namespace
}  // namespace tav::test
