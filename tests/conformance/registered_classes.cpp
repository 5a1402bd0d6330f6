#include "registered_classes.h"

#include <gtest/gtest.h>

#include "class_table.h"
#include "conformance_support.h"
#include "expectations.h"
#include "registry_view.h"

namespace tav::conformance {
namespace {

std::wstring ClassId(int version) {
    const ClassShape* shape = HeaderClass(ClassName(version));
    return shape != nullptr ? GuidText(*shape->clsid) : std::wstring(L"(no such class in the header)");
}

const wchar_t* PlatformKey() { return sizeof(void*) == 8 ? L"win64" : L"win32"; }

// Compares one REG_SZ value, naming where it lives when it differs.
class ValueCheck {
public:
    explicit ValueCheck(HKEY classes) : classes_(classes) {}

    void Expect(const std::wstring& key, const wchar_t* name, const std::wstring& expected) {
        ++compared_;
        EXPECT_EQ(Narrow(expected), Narrow(ReadString(classes_, key, name).value_or(L"(missing)")))
            << Narrow(key) << " value " << (name != nullptr ? Narrow(name) : std::string("(default)"));
    }

    void ExpectPath(const std::wstring& key, const std::wstring& expected) {
        ++compared_;
        const std::wstring actual = ReadString(classes_, key).value_or(L"(missing)");
        EXPECT_TRUE(SamePath(expected, actual)) << Narrow(key) << ": " << Narrow(actual) << ", expected "
                                                << Narrow(expected);
    }

    // A description of any text.
    void ExpectPresent(const std::wstring& key) {
        ++compared_;
        EXPECT_TRUE(ReadString(classes_, key).has_value()) << Narrow(key) << " has no description";
    }

    int Compared() const { return compared_; }

private:
    HKEY classes_;
    int compared_ = 0;
};

}  // namespace

std::wstring ClassKey(int version) { return L"CLSID\\" + ClassId(version); }

std::vector<std::wstring> ClassKeys(int version) {
    return {VersionedProgId(version), ProgId(version), ClassKey(version)};
}

std::wstring TypeLibraryKey() { return L"TypeLib\\" + GuidText(LIBID_TAVCONTROLLERLib); }

int ExpectClassesRegistered(HKEY classes, const std::wstring& modulePath) {
    ValueCheck check(classes);
    const std::wstring library = GuidText(LIBID_TAVCONTROLLERLib);
    for (int version = 1; version <= kClassCount; ++version) {
        const std::wstring clsid = ClassId(version);
        check.Expect(VersionedProgId(version), nullptr, Description(version));
        check.Expect(VersionedProgId(version) + L"\\CLSID", nullptr, clsid);
        check.Expect(ProgId(version), nullptr, ProgIdDescription(version));
        check.Expect(ProgId(version) + L"\\CLSID", nullptr, clsid);
        check.Expect(ProgId(version) + L"\\CurVer", nullptr, VersionedProgId(version));
        const std::wstring key = ClassKey(version);
        check.Expect(key, nullptr, Description(version));
        check.Expect(key + L"\\ProgID", nullptr, VersionedProgId(version));
        check.Expect(key + L"\\VersionIndependentProgID", nullptr, ProgId(version));
        check.ExpectPath(key + L"\\InprocServer32", modulePath);
        check.Expect(key + L"\\InprocServer32", L"ThreadingModel", L"Both");
        check.Expect(key + L"\\TypeLib", nullptr, library);
    }
    return check.Compared();
}

int ExpectTypeLibraryRegistered(HKEY classes, const std::wstring& modulePath) {
    ValueCheck check(classes);
    const std::wstring version = TypeLibraryKey() + L"\\1.0";
    check.ExpectPresent(version);
    check.ExpectPath(version + L"\\0\\" + PlatformKey(), modulePath);
    return check.Compared();
}

int ExpectClassesAbsent(HKEY classes) {
    int looked = 0;
    for (int version = 1; version <= kClassCount; ++version) {
        for (const std::wstring& key : ClassKeys(version)) {
            ++looked;
            EXPECT_FALSE(KeyExists(classes, key)) << Narrow(key) << " is still there";
        }
    }
    return looked;
}

std::wstring DumpClasses(HKEY classes) {
    std::wstring dump;
    for (int version = 1; version <= kClassCount; ++version) {
        for (const std::wstring& key : ClassKeys(version)) dump += DumpTree(classes, key);
    }
    return dump;
}

}  // namespace tav::conformance
