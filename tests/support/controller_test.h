#pragma once
#include <functional>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

#include <gtest/gtest.h>

#include "core/controller_object.h"
#include "support/class_registration.h"
#include "support/error_text.h"
#include "support/fake_command_component.h"
#include "support/fake_user_component.h"
#include "support/reply_recorder.h"
#include "support/test_text.h"
#include "tav/com_scope.h"

namespace tav::test {

// The CLSID of class version 1..17 (TavController ... TavController17).
const CLSID& ClassIdOf(LONG version);

// A test of controller objects against the two fake sibling components,
// registered in-process under CLSID_TavComCtrl and CLSID_TavUser so that Init
// creates them through CoCreateInstance as it would the real ones. Every
// object made here is released at the end of the test.
class ControllerTest : public ::testing::Test {
protected:
    static constexpr LONG kNewest = ControllerObject::kNewestVersion;
    static constexpr const char* kUrl = "/ctrl";

    void SetUp() override;
    void TearDown() override;

    // Swaps in components that lack some interfaces; call before Make.
    void UseComponents(FakeCommandComponent::Offers command, FakeUserComponent::Offers user = {});

    // An object of class version 1..17, made with ControllerObject::Create
    // (or through the class's class object from DllGetClassObject) and
    // initialised with kUrl; ADD_FAILURE when that fails.
    ControllerObject* Make(LONG version = kNewest);
    ControllerObject* MakeThroughClassObject(LONG version = kNewest);
    // The same, before Init.
    ControllerObject* MakeUninitialised(LONG version = kNewest);
    HRESULT Init(ControllerObject* object, std::string_view url = kUrl);
    // The object answers riid (with its own reference released again).
    static bool Answers(ControllerObject* object, REFIID riid);

    FakeCommandComponent& Component() { return *component_; }
    FakeUserComponent& User() { return *user_; }
    FakeClassFactory& ComponentClass() { return *componentClass_; }
    FakeClassFactory& UserClass() { return *userClass_; }
    ReplyRecorder& Callback() { return *callback_; }

    // Shorthands for the command component.
    void Script(std::string_view command, std::string_view replyText, HRESULT status = S_OK) {
        component_->Script(command, replyText, status);
    }
    void Script(std::string_view command, ScriptedReply reply) { component_->Script(command, std::move(reply)); }
    RecordedCommand LastCommand() const { return component_->LastCommand(); }
    size_t CommandCount() const { return component_->CommandCount(); }

    // TavInParams with the test's callback.
    TavInParams AsyncCall(ULONG userDef = 0) { return AsyncParams(callback_.get(), userDef); }
    TavInParams SyncCall(ULONG userDef = 0) { return SyncParams(callback_.get(), userDef); }
    // A callback whose riid names another interface: never to be trusted.
    TavInParams ForeignCallback();

    // The last-error text of object (the last one made when NULL); "" for NULL.
    std::string ErrorText(ControllerObject* object = nullptr);
    ErrorParts Error(ControllerObject* object = nullptr) { return ParseError(ErrorText(object)); }
    // The text is message + ":TavControllerImpl[line]; ".
    ::testing::AssertionResult HasError(std::string_view message, ControllerObject* object = nullptr);
    // The text is adopted + "TavControllerImpl[line]; " (a component's text or a reply's).
    ::testing::AssertionResult HasAdoptedError(std::string_view adopted, ControllerObject* object = nullptr);

    // The checks that every command operation shares, run on fresh objects:
    // a foreign callback, a NULL out-pointer, use before Init, a failing
    // Execute, a failing reply status and an Async call; also that each
    // failure reports its own line. call performs the operation with valid
    // arguments and, when nullOut is set, a NULL out-pointer. It may send any
    // command; the scripts are cleared before and after.
    struct CallPattern {
        std::function<HRESULT(ControllerObject& object, TavInParams* rip, bool nullOut)> call = {};
        std::string invalidParams = {};                 // "GetSystemClock: Invalid TavInParams"
        std::string beforeInit = {};                    // "GetSystemClock. Helper used before initialized."
        std::optional<std::string> nullOut = {};        // nullopt: the operation has no out-pointer
        LONG version = kNewest;
    };
    void ExpectCallPattern(const CallPattern& pattern);

private:
    void Register();
    void Revoke();

    Ref<FakeCommandComponent> component_;
    Ref<FakeUserComponent> user_;
    Ref<FakeClassFactory> componentClass_;
    Ref<FakeClassFactory> userClass_;
    std::optional<ClassRegistration> componentRegistration_;
    std::optional<ClassRegistration> userRegistration_;
    Ref<ReplyRecorder> callback_;
    std::vector<ControllerObject*> objects_;
    std::optional<ComScope> com_;
};

}  // namespace tav::test
