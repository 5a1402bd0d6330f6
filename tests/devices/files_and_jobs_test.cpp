// Copies, diagnostics and the screen dump: paths, texts and result codes.
#include "support/controller_test.h"

namespace tav::test {
namespace {

class FilesAndJobsTest : public ControllerTest {};

TEST_F(FilesAndJobsTest, StatusOperationsFollowTheCallPattern) {
    HRESULT result = S_OK;
    const CallPattern patterns[] = {
        {[&](ControllerObject& o, TavInParams* r, bool n) {
             return o.GetDiagnosticsInfoStatus(r, n ? nullptr : &result);
         },
         "GetDiagnosticsInfoStatus: Invalid TavInParams", "GetDiagnosticsInfoStatus. Helper used before initialized.",
         "GetDiagnosticsInfoStatus: Invalid out-pointer"},
        {[&](ControllerObject& o, TavInParams* r, bool n) {
             return o.GetDorvelScreenDumpStatus(r, n ? nullptr : &result);
         },
         "GetDorvelScreenDumpStatus: Invalid TavInParams", "GetDorvelScreenDumpStatus. Helper used before initialized.",
         "GetDorvelScreenDumpStatus: Invalid out-pointer"},
        {[](ControllerObject& o, TavInParams* r, bool) { return o.ReqDorvelScreenDump(r); },
         "ReqDorvelScreenDump: Invalid TavInParams", "Helper used before initialized.", std::nullopt},
        {[](ControllerObject& o, TavInParams* r, bool) {
             return o.CopyFile(r, TestBstr("ctrl:/a").Get(), TestBstr("ctrl:/b").Get());
         },
         "", "Helper used before initialized.", std::nullopt},
        {[](ControllerObject& o, TavInParams* r, bool) {
             return o.SaveDiagnosticsInfo(r, TestBstr("ctrl:/temp/d.zip").Get());
         },
         "", "Helper used before initialized.", std::nullopt},
    };
    for (const CallPattern& pattern : patterns) {
        SCOPED_TRACE(pattern.invalidParams + pattern.beforeInit);
        ExpectCallPattern(pattern);
    }
}

TEST_F(FilesAndJobsTest, CopiesConvertTheirPathsAndCheckTheirLengths) {
    struct Case {
        const char* source;
        const char* destination;
        const char* error;  // nullptr: sent
        const char* args;
    };
    const std::string longest(260, 'p');
    const std::string ctrlLongest = "ctrl:" + longest;
    const std::string tooLong(261, 'p');
    const Case cases[] = {
        {"ctrl:/hd0a/a.txt", "CTRL:/hd0a/b.txt", nullptr, "-SourcePath \"/hd0a/a.txt\" -DestPath \"/hd0a/b.txt\""},
        {"c:\\local\\a.txt", "ctrl:/b", nullptr, "-SourcePath \"c:\\local\\a.txt\" -DestPath \"/b\""},
        {ctrlLongest.c_str(), "ctrl:/b", nullptr, nullptr},
        {"ctrl:dir\\a.txt", "ctrl:/b", "Invalid controller path. Backslash not allowed.", nullptr},
        {"ctrl:/a", "ctrl:x\\y", "Invalid controller path. Backslash not allowed.", nullptr},
        {"ctrl:", "ctrl:/b", "Empty path", nullptr},
        {"ctrl:/a", "", "Empty path", nullptr},
        {tooLong.c_str(), "ctrl:/b", "Paths too long", nullptr},
    };
    ControllerObject* object = Make();
    for (const Case& c : cases) {
        SCOPED_TRACE(c.source);
        for (const bool directory : {false, true}) {
            const TestBstr source(c.source), destination(c.destination);
            const HRESULT hr = directory ? object->CopyDirectory(nullptr, source.Get(), destination.Get())
                                         : object->CopyFile(nullptr, source.Get(), destination.Get());
            if (c.error != nullptr) {
                EXPECT_EQ(hr, E_INVALIDARG);
                EXPECT_TRUE(HasError(c.error));
            } else {
                ASSERT_EQ(hr, S_OK);
                EXPECT_EQ(LastCommand().command, directory ? "CopyDir" : "CopyFile");
                if (c.args != nullptr) {
                    EXPECT_EQ(LastCommand().args, c.args);
                }
            }
        }
    }
}

TEST_F(FilesAndJobsTest, DiagnosticsGoOnlyToTheController) {
    const std::tuple<const char*, const char*, const char*> cases[] = {
        {"CTRL:/temp/diag.zip", nullptr, "-Path \"/temp/diag.zip\""},
        {"/temp/diag.zip", "SaveDiagnosticsInfo. Only controller path allowed", nullptr},
        {"ctrl:", "Empty path", nullptr},
        {"ctrl:/a\\b", "Invalid controller path. Backslash not allowed.", nullptr},
        {"", "SaveDiagnosticsInfo. Only controller path allowed", nullptr},
    };
    ControllerObject* object = Make();
    for (const auto& [path, error, args] : cases) {
        SCOPED_TRACE(path);
        const HRESULT hr = object->SaveDiagnosticsInfo(nullptr, TestBstr(path).Get());
        if (error != nullptr) {
            EXPECT_EQ(hr, E_INVALIDARG);
            EXPECT_TRUE(HasError(error));
        } else {
            ASSERT_EQ(hr, S_OK);
            EXPECT_EQ(LastCommand().command, "SystemDiagnostics");
            EXPECT_EQ(LastCommand().args, args);
        }
    }
    EXPECT_EQ(object->SaveDiagnosticsInfo(nullptr, nullptr), E_INVALIDARG);
    EXPECT_TRUE(HasError(""));
    EXPECT_EQ(object->SaveDiagnosticsInfo(nullptr, TestBstr("ctrl:/" + std::string(260, 'p')).Get()), E_INVALIDARG);
    EXPECT_TRUE(HasError("Path too long"));
}

TEST_F(FilesAndJobsTest, ResultCodesAreHandedOverBitForBit) {
    struct Decoder {
        HRESULT (STDMETHODCALLTYPE ControllerObject::*unpack)(VARIANT*, HRESULT*);
        const char* name;
    };
    ControllerObject* object = Make();
    for (const Decoder& d : {Decoder{&ControllerObject::UnpackDiagnosticsInfoStatus, "UnpackDiagnosticsInfoStatus"},
                             Decoder{&ControllerObject::UnpackDorvelScreenDump, "UnpackDorvelScreenDump"}}) {
        SCOPED_TRACE(d.name);
        const std::pair<const char*, HRESULT> codes[] = {
            {"-pstatus 0", S_OK}, {"-pstatus 2147500037", E_FAIL}, {"-pstatus 4294967295", static_cast<HRESULT>(-1)}};
        for (const auto& [text, code] : codes) {
            TestVariant reply = TestVariant::Text(text);
            HRESULT result = 12345;
            ASSERT_EQ((object->*d.unpack)(reply.Get(), &result), S_OK) << "the job's failure is no call's failure";
            EXPECT_EQ(result, code);
        }
        TestVariant bad = TestVariant::Text("-pstatus x");
        HRESULT result = 12345;
        EXPECT_EQ((object->*d.unpack)(bad.Get(), &result), E_FAIL);
        EXPECT_TRUE(HasError(std::string(d.name) + ". Invalid argument."));
        EXPECT_EQ(result, 12345);
        TestVariant number = TestVariant::Number(1);
        EXPECT_EQ((object->*d.unpack)(number.Get(), &result), E_FAIL);
        EXPECT_TRUE(HasError(std::string(d.name) + ". Non-BSTR argument."));
        EXPECT_EQ((object->*d.unpack)(nullptr, &result), E_INVALIDARG);
        EXPECT_TRUE(HasError(std::string(d.name) + ". NULL VARIANT"));
        EXPECT_EQ((object->*d.unpack)(number.Get(), nullptr), E_POINTER);
    }
}

}  // namespace
}  // namespace tav::test
