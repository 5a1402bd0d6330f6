// The authorisation system's lists are handed over as the controller wrote
// them; its configuration is not offered.
#include "support/controller_test.h"

namespace tav::test {
namespace {

class AuthorisationTest : public ControllerTest {};

TEST_F(AuthorisationTest, ConfigurationIsNotImplementedAndTouchesNothing) {
    ControllerObject* object = Make();
    LONG read = 77;
    byte* config = reinterpret_cast<byte*>(1);
    EXPECT_EQ(object->GetUASConfiguration(nullptr, TavUASConfigPart_Users, &read, &config), E_NOTIMPL);
    EXPECT_EQ(read, 77);
    EXPECT_EQ(config, reinterpret_cast<byte*>(1));
    EXPECT_EQ(object->SetUASConfiguration(nullptr, TavUASConfigPart_Grants, 4, nullptr), E_NOTIMPL);
    EXPECT_EQ(MakeUninitialised()->GetUASConfiguration(nullptr, TavUASConfigPart_Users, nullptr, nullptr), E_NOTIMPL);
    EXPECT_EQ(CommandCount(), 0u);
}

TEST_F(AuthorisationTest, ListsAreTheRepliesOwnStrings) {
    ControllerObject* object = Make();
    struct Case {
        HRESULT (STDMETHODCALLTYPE ControllerObject::*get)(TavInParams*, BSTR*);
        const char* command;
        const char* name;
    };
    for (const Case& c : {Case{&ControllerObject::GetUserList, "UASUsers", "GetUserList"},
                          Case{&ControllerObject::GetGrantList, "UASGrants", "GetGrantList"}}) {
        SCOPED_TRACE(c.name);
        Component().ClearScript();
        Script(c.command, "<list><item id=\"1\"/></list>");
        TestBstr list;
        ASSERT_EQ((object->*c.get)(nullptr, list.Out()), S_OK);
        EXPECT_EQ(list.Text(), "<list><item id=\"1\"/></list>");
        EXPECT_EQ(LastCommand().verb, "Get");

        Component().ClearScript();
        Script(c.command, ScriptedReply::Number(3));
        EXPECT_EQ((object->*c.get)(nullptr, list.Out()), E_FAIL);
        EXPECT_TRUE(HasError("Get: Bad VARIANT received", object));

        EXPECT_EQ((object->*c.get)(nullptr, nullptr), E_POINTER);
        EXPECT_EQ((MakeUninitialised()->*c.get)(nullptr, list.Out()), E_ABORT);
        EXPECT_EQ(Error(nullptr).message, "Helper used before initialized.");
    }
}

}  // namespace
}  // namespace tav::test
