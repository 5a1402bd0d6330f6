// CheckFileTransferLink goes to the command component's file interface, not
// through a text command.
#include "support/controller_test.h"

namespace tav::test {
namespace {

constexpr HRESULT kLinkDown = static_cast<HRESULT>(0x80041201);

class FileLinkTest : public ControllerTest {};

TEST_F(FileLinkTest, ChecksTheLinkThroughTheFileInterface) {
    ControllerObject* object = Make();
    TavInParams rip = SyncCall(4);
    EXPECT_EQ(object->CheckFileTransferLink(&rip), S_OK);
    ASSERT_EQ(Component().FileCalls().size(), 1u);
    EXPECT_EQ(Component().FileCalls()[0].operation, "CheckLink");
    EXPECT_EQ(Component().FileCalls()[0].params.pointer, &rip);
    EXPECT_EQ(CommandCount(), 0u);
}

TEST_F(FileLinkTest, FailuresCarryTheirTexts) {
    ControllerObject* fresh = MakeUninitialised();
    ControllerObject* object = Make();
    TavInParams foreign = ForeignCallback();
    EXPECT_EQ(object->CheckFileTransferLink(&foreign), E_INVALIDARG);
    EXPECT_TRUE(HasError("CheckFileTransferLink: Invalid TavInParams"));
    EXPECT_EQ(Callback().Count(), 0u);

    TavInParams rip = SyncCall(6);
    EXPECT_EQ(fresh->CheckFileTransferLink(&rip), E_ABORT);
    EXPECT_TRUE(HasError("CheckFileTransferLink. TavController used before Initialized", fresh));
    EXPECT_EQ(Callback().Last().status, E_ABORT);

    Component().Fail(ComOperation::CheckLink, kLinkDown, "No route to controller");
    EXPECT_EQ(object->CheckFileTransferLink(&rip), kLinkDown);
    EXPECT_TRUE(HasAdoptedError("No route to controller"));
    EXPECT_EQ(Callback().Last().status, kLinkDown);
    EXPECT_EQ(Callback().Last().text, ErrorText());
    Component().ClearScript();

    Script("CheckLink", "Link refused", kLinkDown);
    EXPECT_EQ(object->CheckFileTransferLink(nullptr), kLinkDown);
    EXPECT_TRUE(HasAdoptedError("Link refused"));
}

}  // namespace
}  // namespace tav::test
