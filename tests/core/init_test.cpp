// Init: the URL rules, the binding to one controller, the creation of the
// sibling components and the way back from every failing step.
#include <functional>
#include <map>
#include <set>
#include <string>

#include "support/controller_test.h"

namespace tav::test {
namespace {

class InitTest : public ControllerTest {};

TEST_F(InitTest, UrlIsOneSlashAndAName) {
    struct Case {
        const char* url;
        bool valid;
    };
    const Case cases[] = {{"/ctrl", true}, {"/a", true},   {"/", false},  {"/a/", false},  {"/a/b", false},
                          {"a", false},    {"a/", false},  {"", false},   {"//", false},   {"ctrl/x", false}};
    for (const Case& c : cases) {
        SCOPED_TRACE(c.url);
        ControllerObject* object = MakeUninitialised();
        const int created = ComponentClass().Creations();
        if (c.valid) {
            EXPECT_EQ(Init(object, c.url), S_OK);
        } else {
            EXPECT_EQ(Init(object, c.url), E_INVALIDARG);
            EXPECT_TRUE(HasError("TavController::Init - Invalid URL.", object));
            EXPECT_EQ(ComponentClass().Creations(), created) << "created a component for a refused URL";
        }
    }
    ControllerObject* object = MakeUninitialised();
    EXPECT_EQ(object->Init(nullptr), E_INVALIDARG);
    EXPECT_TRUE(HasError("TavController::Init - Invalid URL.", object));
}

TEST_F(InitTest, HandsTheUrlAndTheCommandComponentToTheUserComponentOnce) {
    ControllerObject* object = Make();
    EXPECT_EQ(Init(object, "/ctrl"), S_OK) << "the same URL again does nothing";
    EXPECT_EQ(ComponentClass().Creations(), 1);
    EXPECT_EQ(UserClass().Creations(), 1);
    EXPECT_EQ(User().Initializations(), 1);
    EXPECT_EQ(User().InitializedUrl(), "/ctrl");
    EXPECT_EQ(User().InitializedWith(), static_cast<ITavComCtrl*>(&Component()));
}

TEST_F(InitTest, AnotherUrlIsRefusedAndTheFirstBindingStays) {
    ControllerObject* object = Make();
    EXPECT_EQ(Init(object, "/other"), E_INVALIDARG);
    EXPECT_TRUE(HasError("TavController::Init - Reinitialization to new controller not allowed."));
    EXPECT_EQ(Init(object, "/ctrl/"), E_INVALIDARG);
    EXPECT_TRUE(HasError("TavController::Init - Invalid URL.")) << "the URL is checked first";

    EXPECT_EQ(object->Restart(nullptr, WarmStart), S_OK);
    EXPECT_EQ(LastCommand().url, "/ctrl");
    EXPECT_EQ(ComponentClass().Creations(), 1);
}

TEST_F(InitTest, Command2IsRequiredFromVersion8On) {
    UseComponents({.command2 = false});
    for (LONG version : {1, 7}) {
        EXPECT_EQ(Init(MakeUninitialised(version), kUrl), S_OK) << "version " << version;
    }
    for (LONG version : {8, 17}) {
        ControllerObject* object = MakeUninitialised(version);
        EXPECT_EQ(Init(object, kUrl), E_NOINTERFACE) << "version " << version;
        EXPECT_TRUE(HasError("TavController::Init. Could not create ITavCommand2.", object));
    }
    EXPECT_EQ(MakeThroughClassObject(7)->Version(), 7) << "the class object stamps the version that Init checks";
}

// Each failing step reports its own text and line, keeps no reference on
// either component, and leaves the object ready for another Init.
TEST_F(InitTest, EveryFailingStepLeavesTheObjectReinitialisable) {
    constexpr HRESULT kNotRegistered = REGDB_E_CLASSNOTREG;
    constexpr HRESULT kUserRefused = static_cast<HRESULT>(0x80041234);
    struct Case {
        const char* step;
        std::function<void()> breakIt;
        LONG version;
        HRESULT hr;
        const char* text;
        bool adopted;
    };
    auto components = [this](FakeCommandComponent::Offers command, FakeUserComponent::Offers user) {
        return [=, this] { UseComponents(command, user); };
    };
    const Case cases[] = {
        {"create TavComCtrl", [this] { ComponentClass().FailCreation(kNotRegistered); }, kNewest, kNotRegistered,
         "TavController::Init. Could not create TavComCtrl.", false},
        {"ITavCommand2", components({.command2 = false}, {}), 8, E_NOINTERFACE,
         "TavController::Init. Could not create ITavCommand2.", false},
        {"create TavUser", [this] { UserClass().FailCreation(kNotRegistered); }, kNewest, kNotRegistered,
         "Could not create TavUser", false},
        {"ITavUser3", components({}, {.user3 = false}), kNewest, E_NOINTERFACE, "Could not QI TavUser for ITavUser3",
         false},
        {"ITavMastership", components({}, {.mastership = false}), kNewest, E_NOINTERFACE,
         "Could not QI TavUser for ITavMastership", false},
        {"Initialize", [this] { User().FailInitialize(kUserRefused, "No such user"); }, kNewest, kUserRefused,
         "No such user", true},
        {"Initialize",
         [this] {
             UseComponents({}, {.errorInterface = false});
             User().FailInitialize(kUserRefused, "never read");
         },
         kNewest, kUserRefused, "", true},
        {"ITavFile", components({.file = false}, {}), kNewest, E_FAIL, "Init. Failed to query for ITavFile.", false},
    };
    std::map<std::string, int> lineOfStep;
    for (const Case& c : cases) {
        SCOPED_TRACE(c.step);
        UseComponents({}, {});
        c.breakIt();
        ControllerObject* object = MakeUninitialised(c.version);
        EXPECT_EQ(Init(object, kUrl), c.hr);
        EXPECT_TRUE(c.adopted ? HasAdoptedError(c.text, object) : HasError(c.text, object));
        const int line = Error(object).line;
        EXPECT_EQ(lineOfStep.emplace(c.step, line).first->second, line);
        // Only the test and the class objects hold these components.
        EXPECT_EQ(Component().References(), 2u);
        EXPECT_EQ(User().References(), 2u);
        EXPECT_EQ(object->Restart(nullptr, WarmStart), E_ABORT);

        UseComponents({}, {});
        EXPECT_EQ(Init(object, kUrl), S_OK) << ErrorText(object);
        EXPECT_EQ(object->Restart(nullptr, WarmStart), S_OK);
    }
    std::set<int> lines;
    for (const auto& [step, line] : lineOfStep) {
        EXPECT_TRUE(lines.insert(line).second) << "the failure at " << step << " reports another step's line";
    }
}

}  // namespace
}  // namespace tav::test
