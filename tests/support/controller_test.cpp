#include "support/controller_test.h"

#include <algorithm>

#include "module/server_exports.h"

namespace tav::test {
namespace {

// Codes no layer below would produce by itself.
constexpr HRESULT kTransportFailure = static_cast<HRESULT>(0x80041001);
constexpr HRESULT kRefusedByController = static_cast<HRESULT>(0xC0041002);

GUID foreignIid = IID_IUnknown;

}  // namespace

const CLSID& ClassIdOf(LONG version) {
    static const CLSID* const kClasses[] = {
        &CLSID_TavController,   &CLSID_TavController2,  &CLSID_TavController3,  &CLSID_TavController4,
        &CLSID_TavController5,  &CLSID_TavController6,  &CLSID_TavController7,  &CLSID_TavController8,
        &CLSID_TavController9,  &CLSID_TavController10, &CLSID_TavController11, &CLSID_TavController12,
        &CLSID_TavController13, &CLSID_TavController14, &CLSID_TavController15, &CLSID_TavController16,
        &CLSID_TavController17};
    return *kClasses[std::clamp<LONG>(version, 1, 17) - 1];
}

void ControllerTest::SetUp() {
    com_.emplace();
    callback_ = ReplyRecorder::Make();
    UseComponents({}, {});
}

void ControllerTest::TearDown() {
    component_->JoinDeliveries();
    component_->DropIpcSink();
    for (ControllerObject* object : objects_) {
        static_cast<ITavHelperBase*>(object)->Release();
    }
    objects_.clear();
    Revoke();
    // Every reference the objects took on the components is back.
    EXPECT_EQ(component_->References(), 1u) << "the command component was leaked";
    EXPECT_EQ(user_->References(), 1u) << "the user component was leaked";
    EXPECT_EQ(callback_->References(), 1u) << "the callback was leaked";
    component_.reset();
    user_.reset();
    callback_.reset();
    com_.reset();
}

void ControllerTest::UseComponents(FakeCommandComponent::Offers command, FakeUserComponent::Offers user) {
    Revoke();
    component_ = FakeCommandComponent::Make(command);
    user_ = FakeUserComponent::Make(user);
    Register();
}

void ControllerTest::Register() {
    componentClass_.reset(new FakeClassFactory(static_cast<ITavComCtrl*>(component_.get())));
    userClass_.reset(new FakeClassFactory(static_cast<ITavUserComponent*>(user_.get())));
    componentRegistration_.emplace(CLSID_TavComCtrl, componentClass_.get());
    userRegistration_.emplace(CLSID_TavUser, userClass_.get());
    ASSERT_EQ(componentRegistration_->Result(), S_OK);
    ASSERT_EQ(userRegistration_->Result(), S_OK);
}

void ControllerTest::Revoke() {
    componentRegistration_.reset();
    userRegistration_.reset();
    componentClass_.reset();
    userClass_.reset();
}

ControllerObject* ControllerTest::MakeUninitialised(LONG version) {
    void* made = nullptr;
    const HRESULT hr = ControllerObject::Create(version, nullptr, IID_ITavHelperBase, &made);
    EXPECT_EQ(hr, S_OK) << "ControllerObject::Create(" << version << ")";
    if (made == nullptr) {
        return nullptr;
    }
    auto* object = static_cast<ControllerObject*>(static_cast<ITavHelperBase*>(made));
    objects_.push_back(object);
    return object;
}

ControllerObject* ControllerTest::Make(LONG version) {
    ControllerObject* object = MakeUninitialised(version);
    if (object != nullptr) {
        EXPECT_EQ(Init(object), S_OK) << ErrorText(object);
    }
    return object;
}

ControllerObject* ControllerTest::MakeThroughClassObject(LONG version) {
    IClassFactory* factory = nullptr;
    HRESULT hr = DllGetClassObject(ClassIdOf(version), IID_PPV_ARGS(&factory));
    EXPECT_EQ(hr, S_OK) << "DllGetClassObject for class version " << version;
    if (FAILED(hr)) {
        return nullptr;
    }
    void* made = nullptr;
    hr = factory->CreateInstance(nullptr, IID_ITavHelperBase, &made);
    factory->Release();
    EXPECT_EQ(hr, S_OK) << "CreateInstance for class version " << version;
    if (FAILED(hr)) {
        return nullptr;
    }
    auto* object = static_cast<ControllerObject*>(static_cast<ITavHelperBase*>(made));
    objects_.push_back(object);
    EXPECT_EQ(Init(object), S_OK) << ErrorText(object);
    return object;
}

HRESULT ControllerTest::Init(ControllerObject* object, std::string_view url) {
    TestBstr text(url);
    return object->Init(text.Get());
}

bool ControllerTest::Answers(ControllerObject* object, REFIID riid) {
    IUnknown* answered = nullptr;
    const HRESULT hr = object->QueryInterface(riid, reinterpret_cast<void**>(&answered));
    if (answered != nullptr) {
        answered->Release();
    }
    return SUCCEEDED(hr);
}

TavInParams ControllerTest::ForeignCallback() {
    TavInParams params = SyncCall();
    params.riid = &foreignIid;
    return params;
}

std::string ControllerTest::ErrorText(ControllerObject* object) {
    if (object == nullptr) {
        if (objects_.empty()) {
            return {};
        }
        object = objects_.back();
    }
    TestBstr text;
    object->GetLastErrorInfo(text.Out());
    return text.Text();
}

::testing::AssertionResult ControllerTest::HasError(std::string_view message, ControllerObject* object) {
    const std::string text = ErrorText(object);
    const ErrorParts parts = ParseError(text);
    if (parts.wellFormed && parts.colon && parts.message == message) {
        return ::testing::AssertionSuccess();
    }
    return ::testing::AssertionFailure() << "last error is \"" << text << "\", expected \"" << message
                                         << ":TavControllerImpl[<line>]; \"";
}

::testing::AssertionResult ControllerTest::HasAdoptedError(std::string_view adopted, ControllerObject* object) {
    const std::string text = ErrorText(object);
    const ErrorParts parts = ParseError(text);
    if (parts.wellFormed && !parts.colon && parts.message == adopted) {
        return ::testing::AssertionSuccess();
    }
    return ::testing::AssertionFailure() << "last error is \"" << text << "\", expected \"" << adopted
                                         << "TavControllerImpl[<line>]; \"";
}

void ControllerTest::ExpectCallPattern(const CallPattern& pattern) {
    struct Site {
        const char* failure;
        int line;
    };
    std::vector<Site> sites;
    auto note = [&](const char* failure, ControllerObject* object) { sites.push_back({failure, Error(object).line}); };
    component_->ClearScript();

    {
        SCOPED_TRACE("a callback whose riid is not ITavCommandCallback");
        ControllerObject* object = Make(pattern.version);
        ControllerObject* fresh = MakeUninitialised(pattern.version);
        const size_t sent = CommandCount();
        const size_t told = callback_->Count();
        TavInParams rip = ForeignCallback();
        EXPECT_EQ(pattern.call(*object, &rip, false), E_INVALIDARG);
        EXPECT_TRUE(HasError(pattern.invalidParams, object));
        note("TavInParams", object);
        // It is the first check of all.
        EXPECT_EQ(pattern.call(*fresh, &rip, pattern.nullOut.has_value()), E_INVALIDARG);
        EXPECT_TRUE(HasError(pattern.invalidParams, fresh));
        EXPECT_EQ(CommandCount(), sent) << "sent although the TavInParams were refused";
        EXPECT_EQ(callback_->Count(), told) << "an untrusted callback was called";
    }
    if (pattern.nullOut) {
        SCOPED_TRACE("a NULL out-pointer");
        ControllerObject* object = Make(pattern.version);
        const size_t sent = CommandCount();
        const size_t told = callback_->Count();
        TavInParams rip = SyncCall(0x5EED);
        EXPECT_EQ(pattern.call(*object, &rip, true), E_POINTER);
        EXPECT_TRUE(HasError(*pattern.nullOut, object));
        note("out-pointer", object);
        EXPECT_EQ(CommandCount(), sent);
        ASSERT_EQ(callback_->Count(), told + 1) << "the callback was not told";
        const ReceivedReply reply = callback_->Last();
        EXPECT_EQ(reply.status, E_POINTER);
        EXPECT_EQ(reply.userDef, 0x5EEDu);
        EXPECT_EQ(reply.vt, VT_BSTR);
        EXPECT_EQ(reply.text, ErrorText(object));
        // The out-pointer is checked before the initialised flag.
        ControllerObject* fresh = MakeUninitialised(pattern.version);
        EXPECT_EQ(pattern.call(*fresh, nullptr, true), E_POINTER);
    }
    {
        SCOPED_TRACE("use before Init");
        ControllerObject* fresh = MakeUninitialised(pattern.version);
        const size_t sent = CommandCount();
        const size_t told = callback_->Count();
        TavInParams rip = SyncCall(7);
        EXPECT_EQ(pattern.call(*fresh, &rip, false), E_ABORT);
        EXPECT_TRUE(HasError(pattern.beforeInit, fresh));
        note("initialised flag", fresh);
        EXPECT_EQ(CommandCount(), sent);
        ASSERT_EQ(callback_->Count(), told + 1) << "the callback was not told";
        EXPECT_EQ(callback_->Last().status, E_ABORT);
        EXPECT_EQ(callback_->Last().text, ErrorText(fresh));
    }
    {
        SCOPED_TRACE("Execute fails");
        ControllerObject* object = Make(pattern.version);
        component_->FailExecute(kTransportFailure, "The component gave up");
        const size_t told = callback_->Count();
        TavInParams rip = SyncCall(9);
        EXPECT_EQ(pattern.call(*object, &rip, false), kTransportFailure);
        EXPECT_TRUE(HasAdoptedError("The component gave up", object));
        note("Execute", object);
        EXPECT_EQ(LastCommand().params.pointer, &rip) << "the TavInParams were not passed through";
        ASSERT_EQ(callback_->Count(), told + 1) << "the callback was not told";
        EXPECT_EQ(callback_->Last().status, kTransportFailure);
        EXPECT_EQ(callback_->Last().text, ErrorText(object));
        component_->ClearScript();
    }
    {
        SCOPED_TRACE("the reply status is a failure");
        ControllerObject* object = Make(pattern.version);
        component_->SetDefaultReply(ScriptedReply::Text("The controller refused", kRefusedByController));
        const size_t told = callback_->Count();
        TavInParams rip = SyncCall(11);
        EXPECT_EQ(pattern.call(*object, &rip, false), kRefusedByController);
        EXPECT_TRUE(HasAdoptedError("The controller refused", object));
        note("reply status", object);
        EXPECT_EQ(callback_->Count(), told) << "the component delivers a failed reply itself";
        component_->ClearScript();
    }
    {
        SCOPED_TRACE("an Async call");
        ControllerObject* object = Make(pattern.version);
        TavInParams rip = AsyncCall(0xA5);
        EXPECT_EQ(pattern.call(*object, &rip, false), S_OK);
        EXPECT_EQ(LastCommand().params.pointer, &rip);
        EXPECT_TRUE(LastCommand().params.IsAsync());
        component_->JoinDeliveries();
    }
    {
        SCOPED_TRACE("NULL TavInParams");
        ControllerObject* object = Make(pattern.version);
        const size_t sent = CommandCount();
        pattern.call(*object, nullptr, false);
        EXPECT_GT(CommandCount(), sent);
        EXPECT_TRUE(LastCommand().params.IsNull());
    }
    for (size_t i = 0; i < sites.size(); ++i) {
        EXPECT_GT(sites[i].line, 0) << sites[i].failure;
        for (size_t j = i + 1; j < sites.size(); ++j) {
            EXPECT_NE(sites[i].line, sites[j].line)
                << "the " << sites[i].failure << " and " << sites[j].failure << " failures report one line";
        }
    }
    component_->ClearScript();
}

}  // namespace tav::test
