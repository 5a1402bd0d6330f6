// The registry script interpreter on small scripts.
#include <gtest/gtest.h>

#include "module/registrar.h"
#include "module_test_support.h"
#include "registry_sandbox.h"

namespace tav::test {
namespace {

constexpr HRESULT kMalformed = HRESULT_FROM_WIN32(ERROR_INVALID_DATA);

class RegistrarTest : public ::testing::Test {
protected:
    void SetUp() override { ASSERT_TRUE(sandbox_.Ready()); }

    RegistrySnapshot Classes() const { return TakeSnapshot(HKEY_LOCAL_MACHINE, kClassesKey); }

    RegistrySandbox sandbox_;
    Registrar machine_{RegistrationScope::Machine};
};

TEST_F(RegistrarTest, MalformedScriptsAreRefusedBeforeAnythingIsWritten) {
    const char* scripts[] = {
        "HKCR { Good = s 'x' } HKCR { Bad = s 'y'",        // unclosed block
        "HKCR { Good = s 'x' } HKXX { }",                  // unknown root
        "HKCR { Good = s 'x' Bad = d '1' }",               // only string values exist
        "HKCR { Good = s '%UNKNOWN%' }",                   // unknown variable
        "HKCR { Good = s '100%' }",                        // unpaired percent sign
        "HKCR { Good\\Nested = s 'x' }",                   // one key per entry
        "HKCR { Good = s 'unterminated }",                 // open quote
        "HKCR { val = s 'x' }",                            // value without a name
        "HKCR { = s 'x' }",                                // key without a name
        "HKCR { Good = 'x' }",                             // value without its type
    };
    for (const char* script : scripts) {
        EXPECT_EQ(machine_.Register(script), kMalformed) << script;
        EXPECT_EQ(machine_.Unregister(script), kMalformed) << script;
        EXPECT_TRUE(Classes().empty()) << script;
    }
}

TEST_F(RegistrarTest, QuotesAndVariablesAreExpandedInNamesAndValues) {
    Registrar registrar(RegistrationScope::Machine);
    registrar.SetVariable(OLESTR("NAME"), OLESTR("it's me"));
    ASSERT_EQ(registrar.Register("hkey_classes_root { 'Key %NAME%' = s 'it''s 100%% %NAME%' "
                                 "{ VAL 'Named Value' = s '' } }"),
              S_OK);
    EXPECT_EQ(Classes(), (RegistrySnapshot{"Key it's me", "Key it's me|@=it's 100% it's me",
                                           "Key it's me|Named Value="}));
    ASSERT_EQ(registrar.Unregister("HKCR { 'Key %NAME%' = s 'ignored' { val 'Named Value' = s '' } }"), S_OK);
    EXPECT_TRUE(Classes().empty());
}

TEST_F(RegistrarTest, DeleteRemovesAKeyWithoutWritingIt) {
    WriteString(HKEY_CLASSES_ROOT, "Old\\Sub", "", "obsolete");
    const char* script = "HKCR { Delete Old Kept = s 'k' }";
    ASSERT_EQ(machine_.Register(script), S_OK);
    EXPECT_EQ(Classes(), (RegistrySnapshot{"Kept", "Kept|@=k"}));

    WriteString(HKEY_CLASSES_ROOT, "Old", "", "someone else's");
    ASSERT_EQ(machine_.Unregister(script), S_OK);
    EXPECT_EQ(Classes(), (RegistrySnapshot{"Old", "Old|@=someone else's"}));
}

TEST_F(RegistrarTest, UnregisteringRemovesNamedValuesButKeepsNoRemoveKeys) {
    WriteString(HKEY_CLASSES_ROOT, "Shared", "Other", "foreign");
    const char* script = "HKCR { NoRemove Shared { val Flag = s 'on' Mine = s 'm' { val Mode = s 'x' } } }";
    ASSERT_EQ(machine_.Register(script), S_OK);
    WriteString(HKEY_CLASSES_ROOT, "Shared\\Mine", "Foreign", "value");
    EXPECT_EQ(Classes(), (RegistrySnapshot{"Shared", "Shared|Other=foreign", "Shared|Flag=on", "Shared\\Mine",
                                           "Shared\\Mine|@=m", "Shared\\Mine|Mode=x",
                                           "Shared\\Mine|Foreign=value"}));
    ASSERT_EQ(machine_.Unregister(script), S_OK);
    EXPECT_EQ(Classes(), (RegistrySnapshot{"Shared", "Shared|Other=foreign"}))
        << "a key without subkeys goes, whatever values others gave it";
}

TEST_F(RegistrarTest, PerUserScopeMovesOnlyTheClassesRoot) {
    Registrar user(RegistrationScope::User);
    const char* script = "HKCR { A = s 'a' } HKLM { NoRemove Software { B = s 'b' } }";
    ASSERT_EQ(user.Register(script), S_OK);
    EXPECT_EQ(TakeSnapshot(HKEY_CURRENT_USER, kClassesKey), (RegistrySnapshot{"A", "A|@=a"}));
    EXPECT_EQ(ReadString(HKEY_LOCAL_MACHINE, "Software\\B", ""), "b");
    EXPECT_TRUE(Classes().empty());

    ASSERT_EQ(user.Unregister(script), S_OK);
    EXPECT_TRUE(TakeSnapshot(HKEY_CURRENT_USER, kClassesKey).empty());
    EXPECT_EQ(ReadString(HKEY_LOCAL_MACHINE, "Software\\B", ""), "<missing>");
}

}  // namespace
}  // namespace tav::test
