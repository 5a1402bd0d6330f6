#include <gtest/gtest.h>

#include <fstream>
#include <sstream>
#include <vector>

#include "platform_test_support.h"

#ifndef _WIN32
#include <sys/wait.h>
#include <unistd.h>
#endif

namespace {

using tav::test::OleString;
using tav::test::RegistrySandbox;
using tav::test::Widen;

LSTATUS SetString(HKEY key, const OLECHAR* name, const OLECHAR* text) {
    DWORD bytes = static_cast<DWORD>((OleString(text).size() + 1) * sizeof(OLECHAR));
    return RegSetValueExW(key, name, 0, REG_SZ, reinterpret_cast<const BYTE*>(text), bytes);
}

LSTATUS SetNumber(HKEY key, const OLECHAR* name, DWORD number) {
    return RegSetValueExW(key, name, 0, REG_DWORD, reinterpret_cast<const BYTE*>(&number), sizeof number);
}

OleString QueryString(HKEY key, const OLECHAR* name) {
    OLECHAR text[256] = {};
    DWORD type = REG_NONE;
    DWORD bytes = sizeof text - sizeof(OLECHAR);
    if (RegQueryValueExW(key, name, nullptr, &type, reinterpret_cast<BYTE*>(text), &bytes) != ERROR_SUCCESS ||
        type != REG_SZ)
        return Widen("<missing>");
    return OleString(text);
}

std::vector<OleString> SubkeyNames(HKEY key) {
    std::vector<OleString> names;
    OLECHAR name[256];
    for (DWORD i = 0;; ++i) {
        DWORD length = 256;
        if (RegEnumKeyExW(key, i, name, &length, nullptr, nullptr, nullptr, nullptr) != ERROR_SUCCESS) break;
        names.emplace_back(name, length);
    }
    return names;
}

class Registry : public testing::Test {
protected:
    HKEY Create(const OLECHAR* path, DWORD* disposition = nullptr) {
        HKEY key = nullptr;
        EXPECT_EQ(RegCreateKeyExW(sandbox.Key(), path, 0, nullptr, 0, KEY_ALL_ACCESS, nullptr, &key, disposition),
                  ERROR_SUCCESS);
        return key;
    }
    LSTATUS Open(const OLECHAR* path, HKEY& key) { return RegOpenKeyExW(sandbox.Key(), path, 0, KEY_READ, &key); }

    RegistrySandbox sandbox;
};

TEST_F(Registry, CreateSetQueryAndDeleteValues) {
    DWORD disposition = 0;
    HKEY key = Create(OLESTR("Alpha\\Beta"), &disposition);
    EXPECT_EQ(disposition, static_cast<DWORD>(REG_CREATED_NEW_KEY));
    ASSERT_EQ(SetString(key, nullptr, OLESTR("default text")), ERROR_SUCCESS);
    ASSERT_EQ(SetString(key, OLESTR("ThreadingModel"), OLESTR("Both")), ERROR_SUCCESS);
    ASSERT_EQ(SetNumber(key, OLESTR("Count"), 42), ERROR_SUCCESS);

    EXPECT_EQ(QueryString(key, nullptr), OLESTR("default text"));
    EXPECT_EQ(QueryString(key, OLESTR("")), OLESTR("default text"));
    DWORD number = 0, type = 0, bytes = sizeof number;
    ASSERT_EQ(RegQueryValueExW(key, OLESTR("Count"), nullptr, &type, reinterpret_cast<BYTE*>(&number), &bytes),
              ERROR_SUCCESS);
    EXPECT_EQ(type, static_cast<DWORD>(REG_DWORD));
    EXPECT_EQ(number, 42u);

    EXPECT_EQ(RegDeleteValueW(key, OLESTR("Count")), ERROR_SUCCESS);
    EXPECT_EQ(RegDeleteValueW(key, OLESTR("Count")), ERROR_FILE_NOT_FOUND);
    EXPECT_EQ(RegQueryValueExW(key, OLESTR("Count"), nullptr, nullptr, nullptr, nullptr), ERROR_FILE_NOT_FOUND);
    RegCloseKey(key);

    key = Create(OLESTR("Alpha\\Beta"), &disposition);
    EXPECT_EQ(disposition, static_cast<DWORD>(REG_OPENED_EXISTING_KEY));
    RegCloseKey(key);
}

TEST_F(Registry, QueryReportsTheSizeItNeeds) {
    HKEY key = Create(OLESTR("Sized"));
    ASSERT_EQ(SetString(key, OLESTR("Path"), OLESTR("abcdef")), ERROR_SUCCESS);
    DWORD bytes = 0;
    ASSERT_EQ(RegQueryValueExW(key, OLESTR("Path"), nullptr, nullptr, nullptr, &bytes), ERROR_SUCCESS);
    EXPECT_EQ(bytes, 14u);
    BYTE small[4];
    bytes = sizeof small;
    EXPECT_EQ(RegQueryValueExW(key, OLESTR("Path"), nullptr, nullptr, small, &bytes), ERROR_MORE_DATA);
    EXPECT_EQ(bytes, 14u);
    RegCloseKey(key);
}

TEST_F(Registry, NamesAreFoundWhateverTheirCase) {
    HKEY key = Create(OLESTR("InprocServer32"));
    ASSERT_EQ(SetString(key, OLESTR("ThreadingModel"), OLESTR("Both")), ERROR_SUCCESS);
    RegCloseKey(key);

    HKEY other = Create(OLESTR("INPROCSERVER32"));
    EXPECT_EQ(QueryString(other, OLESTR("threadingmodel")), OLESTR("Both"));
    ASSERT_EQ(SetString(other, OLESTR("THREADINGMODEL"), OLESTR("Free")), ERROR_SUCCESS);
    EXPECT_EQ(QueryString(other, OLESTR("ThreadingModel")), OLESTR("Free"));
    RegCloseKey(other);
    // The name keeps the case it was created with.
    EXPECT_EQ(SubkeyNames(sandbox.Key()), std::vector<OleString>{OLESTR("InprocServer32")});
}

TEST_F(Registry, TheRightsAskedForLimitTheHandle) {
    HKEY key = Create(OLESTR("Guarded"));
    SetString(key, OLESTR("Value"), OLESTR("x"));
    RegCloseKey(key);

    ASSERT_EQ(RegOpenKeyExW(sandbox.Key(), OLESTR("Guarded"), 0, KEY_READ, &key), ERROR_SUCCESS);
    EXPECT_EQ(QueryString(key, OLESTR("Value")), OLESTR("x"));
    EXPECT_EQ(SetString(key, OLESTR("Value"), OLESTR("y")), ERROR_ACCESS_DENIED);
    EXPECT_EQ(RegDeleteValueW(key, OLESTR("Value")), ERROR_ACCESS_DENIED);
    RegCloseKey(key);

    ASSERT_EQ(RegOpenKeyExW(sandbox.Key(), OLESTR("Guarded"), 0, KEY_SET_VALUE, &key), ERROR_SUCCESS);
    EXPECT_EQ(SetString(key, OLESTR("Value"), OLESTR("y")), ERROR_SUCCESS);
    EXPECT_EQ(RegQueryValueExW(key, OLESTR("Value"), nullptr, nullptr, nullptr, nullptr), ERROR_ACCESS_DENIED);
    OLECHAR name[16];
    DWORD length = 16;
    EXPECT_EQ(RegEnumKeyExW(key, 0, name, &length, nullptr, nullptr, nullptr, nullptr), ERROR_ACCESS_DENIED);
    RegCloseKey(key);
}

TEST_F(Registry, EnumeratesSubkeysAndValues) {
    for (const OLECHAR* name : {OLESTR("Gamma"), OLESTR("alpha"), OLESTR("Beta")}) RegCloseKey(Create(name));
    std::vector<OleString> names = SubkeyNames(sandbox.Key());
    std::vector<OleString> expected = {OLESTR("alpha"), OLESTR("Beta"), OLESTR("Gamma")};
    EXPECT_EQ(names, expected);

    HKEY key = Create(OLESTR("Values"));
    SetString(key, OLESTR("First"), OLESTR("1"));
    SetNumber(key, OLESTR("Second"), 2);
    OLECHAR name[16];
    DWORD length = 16, type = 0;
    ASSERT_EQ(RegEnumValueW(key, 1, name, &length, nullptr, &type, nullptr, nullptr), ERROR_SUCCESS);
    EXPECT_EQ(OleString(name, length), OLESTR("Second"));
    EXPECT_EQ(type, static_cast<DWORD>(REG_DWORD));
    length = 3;
    EXPECT_EQ(RegEnumValueW(key, 0, name, &length, nullptr, nullptr, nullptr, nullptr), ERROR_MORE_DATA);
    length = 16;
    EXPECT_EQ(RegEnumValueW(key, 2, name, &length, nullptr, nullptr, nullptr, nullptr), ERROR_NO_MORE_ITEMS);
    RegCloseKey(key);
}

TEST_F(Registry, DeleteKeyNeedsAnEmptyKeyDeleteTreeDoesNot) {
    RegCloseKey(Create(OLESTR("Tree\\Branch\\Leaf")));
    EXPECT_NE(RegDeleteKeyW(sandbox.Key(), OLESTR("Tree")), ERROR_SUCCESS);
    EXPECT_EQ(RegDeleteKeyW(sandbox.Key(), OLESTR("Tree\\Branch\\Leaf")), ERROR_SUCCESS);
    EXPECT_EQ(RegDeleteKeyW(sandbox.Key(), OLESTR("Tree\\Branch\\Leaf")), ERROR_FILE_NOT_FOUND);
    RegCloseKey(Create(OLESTR("Tree\\Branch\\Leaf")));
    EXPECT_EQ(RegDeleteTreeW(sandbox.Key(), OLESTR("Tree")), ERROR_SUCCESS);
    HKEY gone = nullptr;
    EXPECT_EQ(Open(OLESTR("Tree"), gone), ERROR_FILE_NOT_FOUND);
    EXPECT_EQ(RegDeleteTreeW(sandbox.Key(), OLESTR("Tree")), ERROR_FILE_NOT_FOUND);
    gone = reinterpret_cast<HKEY>(1);
    EXPECT_EQ(Open(OLESTR("Nowhere\\Else"), gone), ERROR_FILE_NOT_FOUND);
    EXPECT_EQ(gone, nullptr);
}

TEST_F(Registry, DeleteTreeWithoutSubkeyEmptiesTheKeyButKeepsIt) {
    HKEY key = Create(OLESTR("Keep"));
    SetString(key, OLESTR("Value"), OLESTR("x"));
    RegCloseKey(Create(OLESTR("Keep\\Child")));
    ASSERT_EQ(RegDeleteTreeW(key, nullptr), ERROR_SUCCESS);
    EXPECT_TRUE(SubkeyNames(key).empty());
    EXPECT_EQ(QueryString(key, OLESTR("Value")), OLESTR("<missing>"));
    RegCloseKey(key);
    HKEY kept = nullptr;
    EXPECT_EQ(Open(OLESTR("Keep"), kept), ERROR_SUCCESS);
    RegCloseKey(kept);
}

#ifndef _WIN32

std::string FileText(const std::filesystem::path& file) {
    std::ifstream in(file);
    std::stringstream text;
    text << in.rdbuf();
    return text.str();
}

TEST_F(Registry, ChangesAreInTheFileAndReadBackFromIt) {
    HKEY key = Create(OLESTR("Persisted\\Clsid"));
    const OLECHAR tricky[] = u"quote \" percent % newline \n \u00e9\u4e2d";
    SetString(key, nullptr, tricky);
    SetNumber(key, OLESTR("Flags"), 0xDEADBEEF);
    const BYTE oddBytes[] = {1, 2, 3};
    RegSetValueExW(key, OLESTR("Odd"), 0, REG_SZ, oddBytes, sizeof oddBytes);
    RegCloseKey(key);
    std::string written = FileText(sandbox.File());
    EXPECT_NE(written.find("Persisted\\Clsid]"), std::string::npos);

    // Another file makes the process forget; coming back reads the file again.
    auto elsewhere = sandbox.File().parent_path() / "other";
    TavSetRegistryFile(elsewhere.c_str());
    HKEY missing = nullptr;
    EXPECT_EQ(Open(OLESTR("Persisted"), missing), ERROR_KEY_DELETED);  // the sandbox key is not in that file
    TavSetRegistryFile(sandbox.File().c_str());

    ASSERT_EQ(Open(OLESTR("PERSISTED\\clsid"), key), ERROR_SUCCESS);
    EXPECT_EQ(QueryString(key, nullptr), tricky);
    DWORD number = 0, bytes = sizeof number;
    RegQueryValueExW(key, OLESTR("Flags"), nullptr, nullptr, reinterpret_cast<BYTE*>(&number), &bytes);
    EXPECT_EQ(number, 0xDEADBEEFu);
    BYTE odd[8];
    DWORD type = 0;
    bytes = sizeof odd;
    ASSERT_EQ(RegQueryValueExW(key, OLESTR("Odd"), nullptr, &type, odd, &bytes), ERROR_SUCCESS);
    EXPECT_EQ(type, static_cast<DWORD>(REG_SZ));
    EXPECT_EQ(OleString(reinterpret_cast<OLECHAR*>(odd), 1), OLESTR("\x0201"));
    EXPECT_EQ(bytes, 3u);
    RegCloseKey(key);
    EXPECT_EQ(FileText(sandbox.File()), written);  // reading wrote nothing
}

TEST_F(Registry, ACorruptFileIsReportedAndNotOverwritten) {
    {
        std::ofstream out(sandbox.File());
        out << "not a registry\n";
    }
    HKEY key = nullptr;
    EXPECT_EQ(Open(OLESTR(""), key), ERROR_BADDB);
    EXPECT_EQ(RegCreateKeyExW(HKEY_CURRENT_USER, OLESTR("X"), 0, nullptr, 0, KEY_ALL_ACCESS, nullptr, &key, nullptr),
              ERROR_BADDB);
    EXPECT_EQ(FileText(sandbox.File()), "not a registry\n");
}

// Windows stops at 512 levels of keys; a file nested deeper is refused as
// corrupt rather than read (and written back) without end.
TEST_F(Registry, KeysDeeperThanWindowsAllowsAreRefused) {
    std::u16string deep;
    for (int level = 0; level < 600; ++level) deep += u"k\\";
    HKEY key = nullptr;
    EXPECT_EQ(RegCreateKeyExW(HKEY_CURRENT_USER, reinterpret_cast<LPCWSTR>(deep.c_str()), 0, nullptr, 0,
                              KEY_ALL_ACCESS, nullptr, &key, nullptr),
              ERROR_INVALID_PARAMETER);
    std::string path = "HKEY_CURRENT_USER";
    for (int level = 0; level < 513; ++level) path += "\\k";
    {
        std::ofstream out(sandbox.File());
        out << "; TavController registry 1\n[" << path << "]\n";
    }
    EXPECT_EQ(Open(OLESTR(""), key), ERROR_BADDB);
}

TEST_F(Registry, AKeyDeletedUnderAnOpenHandleIsReportedAsDeleted) {
    HKEY key = Create(OLESTR("Doomed"));
    ASSERT_EQ(RegDeleteTreeW(sandbox.Key(), OLESTR("Doomed")), ERROR_SUCCESS);
    EXPECT_EQ(SetNumber(key, OLESTR("Late"), 1), ERROR_KEY_DELETED);
    RegCloseKey(key);
    EXPECT_EQ(RegCloseKey(key), ERROR_INVALID_HANDLE);
}

TEST_F(Registry, ClassesRootIsTheMachineClassesKey) {
    HKEY key = nullptr;
    ASSERT_EQ(RegCreateKeyExW(HKEY_CLASSES_ROOT, OLESTR("TavController.Test"), 0, nullptr, 0, KEY_ALL_ACCESS, nullptr,
                              &key, nullptr),
              ERROR_SUCCESS);
    RegCloseKey(key);
    EXPECT_EQ(RegOpenKeyExW(HKEY_LOCAL_MACHINE, OLESTR("Software\\Classes\\TavController.Test"), 0, KEY_READ, &key),
              ERROR_SUCCESS);
    RegCloseKey(key);
}

// A batch keeps its changes in memory, where the process reads them, and
// writes the file once at the end of the outermost batch, with every change.
TEST_F(Registry, ABatchIsReadInMemoryAndSavedOnceAtItsEnd) {
    HKEY key = Create(OLESTR("Batched"));
    const std::string before = FileText(sandbox.File());
    {
        tav::RegistryBatch outer;
        SetNumber(key, OLESTR("First"), 1);
        {
            tav::RegistryBatch inner;
            SetString(key, OLESTR("Second"), OLESTR("two"));
            EXPECT_EQ(inner.End(), ERROR_SUCCESS);
        }
        RegCloseKey(Create(OLESTR("Batched\\Child")));
        EXPECT_EQ(QueryString(key, OLESTR("Second")), OLESTR("two"));
        EXPECT_EQ(SubkeyNames(key), std::vector<OleString>{OLESTR("Child")});
        EXPECT_EQ(FileText(sandbox.File()), before) << "nothing written before the outermost batch ends";
        EXPECT_EQ(outer.End(), ERROR_SUCCESS);
    }
    const std::string after = FileText(sandbox.File());
    EXPECT_NE(after.find("\"Second\"=\"two\""), std::string::npos);
    EXPECT_NE(after.find("Batched\\Child]"), std::string::npos);
    RegCloseKey(key);
}

// Two processes write at once: with the lock and the re-read before each
// change, neither loses the other's keys.
TEST_F(Registry, TwoProcessesWritingAtOnceLoseNothing) {
    constexpr int keysPerProcess = 40;
    auto writeKeys = [](const char* prefix) {
        for (int i = 0; i < keysPerProcess; ++i) {
            OleString name = Widen(prefix) + Widen(std::to_string(i));
            HKEY key = nullptr;
            if (RegCreateKeyExW(HKEY_CURRENT_USER, name.c_str(), 0, nullptr, 0, KEY_ALL_ACCESS, nullptr, &key,
                                nullptr) != ERROR_SUCCESS)
                return false;
            RegCloseKey(key);
        }
        return true;
    };
    pid_t child = fork();
    ASSERT_GE(child, 0);
    if (child == 0) _exit(writeKeys("Child") ? 0 : 1);
    EXPECT_TRUE(writeKeys("Parent"));
    int status = 0;
    waitpid(child, &status, 0);
    ASSERT_TRUE(WIFEXITED(status) && WEXITSTATUS(status) == 0);

    std::size_t found = 0;
    for (const OleString& name : SubkeyNames(HKEY_CURRENT_USER))
        found += name.starts_with(OLESTR("Child")) || name.starts_with(OLESTR("Parent"));
    EXPECT_EQ(found, 2u * keysPerProcess);
}

#endif

}  // namespace
