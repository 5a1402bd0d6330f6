// The last-error text: one per object, replaced by each failure, read and
// written by the client.
#include "support/controller_test.h"

namespace tav::test {
namespace {

class ErrorInfoTest : public ControllerTest {};

TEST_F(ErrorInfoTest, FreshObjectHasNoText) {
    ControllerObject* object = MakeUninitialised();
    BSTR text = reinterpret_cast<BSTR>(&text);
    EXPECT_EQ(object->GetLastErrorInfo(&text), S_OK);
    EXPECT_EQ(text, nullptr);
}

TEST_F(ErrorInfoTest, OnlyTheLatestFailureRemainsAndSuccessKeepsIt) {
    ControllerObject* object = Make();
    EXPECT_EQ(object->Restart(nullptr, static_cast<TavRestartMode>(9)), E_INVALIDARG);
    EXPECT_EQ(object->GetSystemClock(nullptr, nullptr), E_POINTER);
    EXPECT_TRUE(HasError("GetSystemClock: Invalid out-pointer"));

    EXPECT_EQ(object->Restart(nullptr, WarmStart), S_OK);
    EXPECT_TRUE(HasError("GetSystemClock: Invalid out-pointer")) << "reading or succeeding cleared it";
}

TEST_F(ErrorInfoTest, ClientSetsTheTextFromABstrAndAnythingElseEmptiesIt) {
    ControllerObject* object = MakeUninitialised();
    TestVariant data = TestVariant::Text("Reply text of an Async call");
    EXPECT_EQ(object->SetLastErrorInfo(data.Get()), S_OK);
    EXPECT_EQ(ErrorText(object), "Reply text of an Async call");

    TestVariant number = TestVariant::Number(5);
    EXPECT_EQ(object->SetLastErrorInfo(number.Get()), E_FAIL);
    TestBstr text;
    EXPECT_EQ(object->GetLastErrorInfo(text.Out()), S_OK);
    EXPECT_FALSE(text.IsNull()) << "emptied, not removed";
    EXPECT_EQ(text.Text(), "");
}

TEST_F(ErrorInfoTest, EachObjectKeepsItsOwnText) {
    ControllerObject* first = Make();
    ControllerObject* second = Make();
    first->GetSystemClock(nullptr, nullptr);
    second->Restart(nullptr, static_cast<TavRestartMode>(7));
    EXPECT_TRUE(HasError("GetSystemClock: Invalid out-pointer", first));
    EXPECT_TRUE(HasError("Restart. Unknown restart mode", second));
}

}  // namespace
}  // namespace tav::test
