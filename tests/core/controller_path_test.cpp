// Controller paths: the strict rule of the operations that take nothing else,
// and the rule of those that also take a local path.
#include "support/controller_test.h"

namespace tav::test {
namespace {

class ControllerPathTest : public ControllerTest {};

constexpr ControllerPathTexts kTexts{OLESTR("Op - Only controller path allowed."),
                                     OLESTR("Op - Invalid controller path. Backslash not allowed."),
                                     OLESTR("Op. Controller path empty")};

TEST_F(ControllerPathTest, OnlyControllerPathsPassTheStrictRule) {
    struct Case {
        const char* path;
        const char* sent;   // nullptr: refused
        const char* error;  // the message, when refused
    };
    const Case cases[] = {
        {"ctrl:/bak/b1", "/bak/b1", nullptr},
        {"CTRL:/bak/b1", "/bak/b1", nullptr},
        {"cTrL:bak", "bak", nullptr},
        {"ctrl: x ", " x ", nullptr},
        {"", nullptr, ""},
        {" \t ", nullptr, ""},
        {"c:/bak", nullptr, "Op - Only controller path allowed."},
        {"ctrl", nullptr, "Op - Only controller path allowed."},
        {"ctrl:/bak\\b1", nullptr, "Op - Invalid controller path. Backslash not allowed."},
        {"\\ctrl:/bak", nullptr, "Op - Only controller path allowed."},
        {"ctrl:", nullptr, "Op. Controller path empty"},
        {"ctrl:   ", nullptr, "Op. Controller path empty"},
    };
    ControllerObject* object = Make();
    std::set<int> lines;
    for (const Case& c : cases) {
        SCOPED_TRACE(c.path);
        TestBstr path(c.path);
        OleStringView sent;
        const HRESULT hr = object->Command(nullptr).ControllerPathOnly(path.Get(), kTexts, &sent).Result();
        if (c.sent != nullptr) {
            EXPECT_EQ(hr, S_OK);
            EXPECT_EQ(Narrow(sent), c.sent);
        } else {
            EXPECT_EQ(hr, E_INVALIDARG);
            EXPECT_TRUE(HasError(c.error));
            lines.insert(Error().line);
        }
    }
    EXPECT_EQ(lines.size(), 4u) << "each failure from a line of its own";
    OleStringView sent;
    EXPECT_EQ(object->Command(nullptr).ControllerPathOnly(nullptr, kTexts, &sent).Result(), E_INVALIDARG);
}

TEST_F(ControllerPathTest, LocalPathsPassUnchanged) {
    struct Case {
        const char* path;
        const char* converted;  // nullptr: refused
    };
    const Case cases[] = {
        {"ctrl:/temp/a.txt", "/temp/a.txt"}, {"Ctrl:", ""},        {"c:\\local\\a.txt", "c:\\local\\a.txt"},
        {"", ""},                            {"ctrl:dir\\a.txt", nullptr},
    };
    ControllerObject* object = Make();
    for (const Case& c : cases) {
        SCOPED_TRACE(c.path);
        TestBstr path(c.path);
        OleStringView converted;
        const HRESULT hr =
            object->Command(nullptr).ControllerOrLocalPath(path.Get(), OLESTR("Bad path"), &converted).Result();
        if (c.converted != nullptr) {
            EXPECT_EQ(hr, S_OK);
            EXPECT_EQ(Narrow(converted), c.converted);
        } else {
            EXPECT_EQ(hr, E_INVALIDARG);
            EXPECT_TRUE(HasError("Bad path"));
        }
    }
    OleStringView converted = OLESTR("x");
    EXPECT_EQ(object->Command(nullptr).ControllerOrLocalPath(nullptr, OLESTR("Bad path"), &converted).Result(), S_OK);
    EXPECT_TRUE(converted.empty()) << "a NULL path is an empty one";
}

}  // namespace
}  // namespace tav::test
