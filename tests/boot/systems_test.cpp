// Installed systems, the boot device and the boot image.
#include "support/controller_test.h"

namespace tav::test {
namespace {

class SystemsTest : public ControllerTest {};

TEST_F(SystemsTest, CommandsFollowTheCallPatternWithTheirTexts) {
    TestBstr text;
    ULONG count = 0;
    LONG done = 0;
    TavRetrievalParams retrieval{};
    ITavEnumBSTR* names = nullptr;
    const CallPattern patterns[] = {
        {[&](ControllerObject& o, TavInParams* r, bool n) { return o.GetSystemName(r, n ? nullptr : text.Out()); },
         "GetSystemName: Invalid TavInParams", "GetSystemName. TavController used before Initialized",
         "GetSystemName: Invalid out-pointer"},
        {[](ControllerObject& o, TavInParams* r, bool) { return o.SelectSystem(r, TestBstr("SYS_A").Get()); },
         "SelectSystem: Invalid TavInParams", "SelectSystem. TavController used before Initialized", std::nullopt},
        {[](ControllerObject& o, TavInParams* r, bool) { return o.DeselectSystem(r); },
         "DeselectSystem: Invalid TavInParams", "DeselectSystem. TavController used before Initialized", std::nullopt},
        {[&](ControllerObject& o, TavInParams* r, bool n) { return o.GetSelectedSystem(r, n ? nullptr : text.Out()); },
         "GetSelectedSystem: Invalid TavInParams", "GetSelectedSystem. TavController used before Initialized",
         "GetSelectedSystem: Invalid out-pointer"},
        {[&](ControllerObject& o, TavInParams* r, bool n) {
             return o.GetSystemNameList(r, n ? nullptr : &retrieval, &names);
         },
         "GetSystemNameList: Invalid TavInParams", "GetSystemNameList. TavController used before Initialized",
         "GetSystemNameList: Invalid out-pointer"},
        {[](ControllerObject& o, TavInParams* r, bool) { return o.RemoveSystem(r, TestBstr("SYS_A").Get()); },
         "RemoveSystem: Invalid TavInParams", "RemoveSystem. TavController used before Initialized", std::nullopt},
        {[](ControllerObject& o, TavInParams* r, bool) { return o.SetBootDevice(r, TestBstr("hd0a").Get()); },
         "SetBootDevice: Invalid TavInParams", "SetBootDevice. TavController used before Initialized", std::nullopt},
        {[&](ControllerObject& o, TavInParams* r, bool n) { return o.GetBootDevice(r, n ? nullptr : text.Out()); },
         "GetBootDevice: Invalid TavInParams", "GetBootDevice. TavController used before Initialized",
         "GetBootDevice: Invalid out-pointer"},
        {[&](ControllerObject& o, TavInParams* r, bool n) { return o.GetNoOfSpannedFiles(r, n ? nullptr : &count); },
         "GetNoOfSpannedFiles: Invalid TavInParams", "GetNoOfSpannedFiles. TavController used before Initialized",
         "GetNoOfSpannedFiles: Invalid out-pointer"},
        {[&](ControllerObject& o, TavInParams* r, bool n) { return o.LoadBootImage(r, n ? nullptr : &done); },
         "LoadBootImage: Invalid TavInParams", "LoadBootImage. TavController used before Initialized",
         "LoadBootImage. Invalid out-pointer"},
        {[](ControllerObject& o, TavInParams* r, bool) { return o.UndoLoadBootImage(r); },
         "UndoLoadBootImage: Invalid TavInParams", "UndoLoadBootImage. TavController used before Initialized",
         std::nullopt},
    };
    for (const CallPattern& pattern : patterns) {
        SCOPED_TRACE(pattern.invalidParams);
        ExpectCallPattern(pattern);
        if (names != nullptr) {
            names->Release();
            names = nullptr;
        }
    }
}

TEST_F(SystemsTest, NamesAreCheckedBeforeInitialisation) {
    ControllerObject* fresh = MakeUninitialised();
    const std::string longest(256, 's');
    EXPECT_EQ(fresh->SelectSystem(nullptr, TestBstr(longest + "s").Get()), E_INVALIDARG);
    EXPECT_TRUE(HasError("SelectSystem: Invalid system-name", fresh));
    EXPECT_EQ(fresh->RemoveSystem(nullptr, nullptr), E_INVALIDARG);
    EXPECT_TRUE(HasError("RemoveSystem. Invalid system-name.", fresh));
    EXPECT_EQ(fresh->SetBootDevice(nullptr, TestBstr("").Get()), E_INVALIDARG);
    EXPECT_TRUE(HasError("SetBootDevice: Invalid bootDevice.", fresh));

    ControllerObject* object = Make();
    ASSERT_EQ(object->SelectSystem(nullptr, TestBstr(longest).Get()), S_OK);
    EXPECT_EQ(LastCommand().args, "-Name \"" + longest + "\"");
    // The length counts to the first NUL.
    const OLECHAR withNul[] = {u'A', 0, u'B'};
    TestBstr cut(OleStringView(withNul, 3));
    ASSERT_EQ(object->RemoveSystem(nullptr, cut.Get()), S_OK);
    const TestBstr device(std::string(10000, 'd'));
    ASSERT_EQ(object->SetBootDevice(nullptr, device.Get()), S_OK);
    EXPECT_EQ(LastCommand().command, "BootDevice");
}

TEST_F(SystemsTest, NameRepliesKeepWhatFollowsTheKey) {
    struct Decoder {
        HRESULT (STDMETHODCALLTYPE ControllerObject::*unpack)(VARIANT*, BSTR*);
        const char* nullData;
        const char* nullOut;
        const char* notText;
        const char* badFormat;
    };
    const Decoder decoders[] = {
        {&ControllerObject::UnpackSystemName, "UnpackSystemName. NULL data pointer",
         "UnpackSystemName. Invalid out pointer", "UnpackSystemName. Data-variant not of type VT_BSTR",
         "UnpackSystemName. Bad format."},
        // The selected system reads through the system name's decoder, texts and all.
        {&ControllerObject::UnpackSelectedSystem, "UnpackSystemName. NULL data pointer",
         "UnpackSystemName. Invalid out pointer", "UnpackSystemName. Data-variant not of type VT_BSTR",
         "UnpackSystemName. Bad format."},
        {&ControllerObject::UnpackBootDevice, "UnpackBootDevice. NULL data-variant", "UnpackBootDevice. Invalid pointer",
         "UnpackBootDevice. Data-variant not of type VT_BSTR", "UnpackBootDevice failed."},
    };
    ControllerObject* object = Make();
    for (const Decoder& d : decoders) {
        SCOPED_TRACE(d.nullData);
        TestVariant quoted = TestVariant::Text("-Name \"SYS_A\" -Extra 1 ");
        TestBstr name;
        ASSERT_EQ((object->*d.unpack)(quoted.Get(), name.Out()), S_OK);
        EXPECT_EQ(name.Text(), "\"SYS_A\" -Extra 1 ");
        TestVariant noBlank = TestVariant::Text("-Name\"SYS_A\"");
        EXPECT_EQ((object->*d.unpack)(noBlank.Get(), name.Out()), E_FAIL);
        EXPECT_TRUE(HasError(d.badFormat));
        EXPECT_TRUE(name.IsNull());
        TestVariant number = TestVariant::Number(1);
        EXPECT_EQ((object->*d.unpack)(number.Get(), name.Out()), E_FAIL);
        EXPECT_TRUE(HasError(d.notText));
        EXPECT_EQ((object->*d.unpack)(number.Get(), nullptr), E_POINTER);
        EXPECT_TRUE(HasError(d.nullOut));
        EXPECT_EQ((object->*d.unpack)(nullptr, nullptr), E_INVALIDARG);
        EXPECT_TRUE(HasError(d.nullData));
    }
}

TEST_F(SystemsTest, NumbersOfTheBootReplies) {
    ControllerObject* object = Make();
    const std::tuple<const char*, HRESULT, LONG> images[] = {
        {"-IsDone 1", S_OK, 1}, {"-IsDone 2", S_OK, 0}, {"-IsDone -1", S_OK, 0}, {"-IsDone x", E_FAIL, 0}};
    for (const auto& [text, result, done] : images) {
        TestVariant reply = TestVariant::Text(text);
        LONG value = 7;
        EXPECT_EQ(object->UnpackLoadBootImage(reply.Get(), &value), result) << text;
        EXPECT_EQ(value, done) << text;
    }
    EXPECT_TRUE(HasError("UnpackLoadBootImage failed."));
    TestVariant files = TestVariant::Text("-FileCount 4294967295");
    ULONG count = 0;
    ASSERT_EQ(object->UnpackNoOfSpannedFiles(files.Get(), &count), S_OK);
    EXPECT_EQ(count, 4294967295u);
    TestVariant bad = TestVariant::Text("-FileCount");
    EXPECT_EQ(object->UnpackNoOfSpannedFiles(bad.Get(), &count), E_FAIL);
    EXPECT_TRUE(HasError("UnpackNoOfSpannedFiles failed."));
    EXPECT_EQ(count, 0u);
}

std::vector<std::string> Drain(ITavEnumBSTR* names) {
    std::vector<std::string> all;
    BSTR name = nullptr;
    while (names->RemNext(1, &name, nullptr) == S_OK) {
        all.push_back(Narrow(name));
        SysFreeString(name);
    }
    return all;
}

TEST_F(SystemsTest, SystemListsCountTheirTokens) {
    struct Case {
        const char* reply;
        HRESULT result;
        std::vector<std::string> names;
        const char* error;
    };
    const Case cases[] = {
        {"-NoOfElements 2 -Names SYS_A,SYS_B", S_OK, {"SYS_A", "SYS_B"}, nullptr},
        {"-NoOfElements 2   -Names  A ,,B", S_OK, {" A ", "B"}, nullptr},
        {"-NoOfElements 0 -Names ", S_OK, {}, nullptr},
        {"-NoOfElements 3 -Names A,B", E_FAIL, {}, "UnpackSystemNameList. Unexpected number of elements."},
        {"-NoOfElements 1 -Names A,B", E_FAIL, {}, "UnpackSystemNameList. Unexpected number of elements."},
        {"-NoOfElements 2 -Names A,B,", S_OK, {"A", "B"}, nullptr},
        {"-NoOfElements 2 -Name A,B", E_FAIL, {}, "UnpackSystemNameList failed."},
        {"-NoOfElements2 -Names A,B", E_FAIL, {}, "UnpackSystemNameList failed."},
        {"-NoOfElements 1073741824 -Names A", E_OUTOFMEMORY, {}, "UnpackSystemNameList. Out of memory"},
        {"-NoOfElements 1000000 -Names A", E_FAIL, {}, "UnpackSystemNameList. Unexpected number of elements."},
    };
    ControllerObject* object = Make();
    for (const Case& c : cases) {
        SCOPED_TRACE(c.reply);
        TestVariant reply = TestVariant::Text(c.reply);
        TavRetrievalParams retrieval{};
        retrieval.noOfElts = 99;
        retrieval.mark = 5;
        ITavEnumBSTR* names = reinterpret_cast<ITavEnumBSTR*>(1);
        ASSERT_EQ(object->UnpackSystemNameList(reply.Get(), &retrieval, &names), c.result);
        if (SUCCEEDED(c.result)) {
            EXPECT_EQ(Drain(names), c.names);
            names->Release();
            EXPECT_EQ(retrieval.noOfElts, static_cast<LONG>(c.names.size()));
            EXPECT_EQ(retrieval.bLast, 1);
            EXPECT_EQ(retrieval.mark, 0u);
        } else {
            EXPECT_TRUE(HasError(c.error));
            EXPECT_EQ(names, nullptr);
            EXPECT_EQ(retrieval.noOfElts, 0);
        }
    }
}

}  // namespace
}  // namespace tav::test
