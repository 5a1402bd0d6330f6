// Identity, names, version information, environment, options, clients,
// energy state, the file link and the last error.
#include "tavctl/verb.h"

namespace tavctl {
namespace {

using C = ITavController;

int NameGet(Verb& v) {
    v.End();
    return v.Get("GetControllerName", &C::GetControllerName, &C::UnpackControllerName);
}
int NameSet(Verb& v) {
    const auto name = v.Text("NAME");
    v.End();
    return v.Set("SetControllerName", &C::SetControllerName, name.Get());
}
int IdGet(Verb& v) {
    v.End();
    return v.Get("GetControllerID", &C::GetControllerID, &C::UnpackControllerID);
}
int IdSet(Verb& v) {
    const auto id = v.Text("ID");
    v.End();
    return v.Set("SetControllerId", &C::SetControllerId, id.Get());
}
int LanguageSet(Verb& v) {
    const auto language = v.Text("LANGUAGE");
    v.End();
    return v.Set("SetLanguage", &ITavController2::SetLanguage, language.Get());
}
int Guid(Verb& v) {
    v.End();
    return v.Get("GetSystemID", &C::GetSystemID, &C::UnpackSystemID);
}
int Environment(Verb& v) {
    const auto name = v.Text("NAME");
    v.End();
    return v.Get("GetEnvironmentVariable", &C::GetEnvironmentVariable, &C::UnpackEnvironmentVariable, name.Get());
}
int Option(Verb& v) {
    const auto name = v.Text("OPTION");
    v.End();
    return v.GetShown(AsBoolean, "IsOptionPresent", &C::IsOptionPresent, &C::UnpackIsOptionPresent, name.Get());
}
int Clients(Verb& v) {
    v.End();
    return v.Get("GetConnectedTavAPIClients", &ITavController4::GetConnectedTavAPIClients,
                 &ITavController4::UnpackConnectedTavAPIClients);
}
int Energy(Verb& v) {
    v.End();
    return v.Get("GetSysEnergyState", &ITavController4::GetSysEnergyState, &ITavController4::UnpackSysEnergyState);
}
int Link(Verb& v) {
    v.End();
    const int status = v.Set("CheckFileTransferLink", &C::CheckFileTransferLink);
    if (status == kExitOk && !v.session.Options().json) {
        v.session.Print("link OK");
    }
    return status;
}

int VersionInfo(Verb& v, TavControllerInfo type) {
    const auto system = v.OptionalWord();
    v.End();
    if (!system) {
        return v.Get("GetVersionInfo", &C::GetVersionInfo, &C::UnpackVersionInfo, type);
    }
    const auto name = Verb::ToBstr(*system);
    return v.Get("GetVersionInfoFromSystem", &C::GetVersionInfoFromSystem, &C::UnpackVersionInfo, name.Get(), type);
}
int VersionSystem(Verb& v) { return VersionInfo(v, SystemInfo); }
int VersionRelease(Verb& v) { return VersionInfo(v, ReleaseInfo); }
int VersionName(Verb& v) {
    v.End();
    return v.Get("GetVersionName", &ITavController5::GetVersionName, &ITavController5::UnpackVersionName);
}
int VersionProduct(Verb& v) {
    const auto product = v.Text("PRODUCT");
    v.End();
    return v.Get("GetProductVersionName", &ITavController6::GetProductVersionName,
                 &ITavController6::UnpackProductVersionName, product.Get());
}

int LastError(Verb& v) {
    v.End();
    const auto helper = v.Interface<ITavHelperBase>();
    tav::Bstr text;
    const HRESULT hr = helper->GetLastErrorInfo(text.Receive());
    if (FAILED(hr)) {
        return v.session.Fail("GetLastErrorInfo", hr);
    }
    if (!v.session.Options().json && text.IsNull()) {
        v.session.Print("(no error recorded)");
    } else {
        v.session.Show(TextValue(text.Get()));
    }
    return kExitOk;
}

constexpr VerbEntry kName[] = {
    {"get", "", "print the controller's name (GetControllerName)", NameGet},
    {"set", "NAME", "set the controller's name (SetControllerName)", NameSet},
};
constexpr VerbEntry kId[] = {
    {"get", "", "print the controller identifier (GetControllerID)", IdGet},
    {"set", "ID", "set the controller identifier (SetControllerId)", IdSet},
};
constexpr VerbEntry kLanguage[] = {{"set", "LANGUAGE", "set the controller's language (SetLanguage)", LanguageSet}};
constexpr VerbEntry kGuid[] = {{"", "", "print the system GUID (GetSystemID)", Guid}};
constexpr VerbEntry kEnvironment[] = {{"", "NAME", "print a variable (GetEnvironmentVariable)", Environment}};
constexpr VerbEntry kOption[] = {{"", "OPTION", "tell whether an option is installed (IsOptionPresent)", Option}};
constexpr VerbEntry kClients[] = {{"", "", "list the connected API clients as XML (GetConnectedTavAPIClients)", Clients}};
constexpr VerbEntry kEnergy[] = {{"", "", "print the system energy state (GetSysEnergyState)", Energy}};
constexpr VerbEntry kLink[] = {{"", "", "check the file transfer link (CheckFileTransferLink)", Link}};
constexpr VerbEntry kVersion[] = {
    {"", "[SYSTEM]", "the same as version system", VersionSystem},
    {"system", "[SYSTEM]", "print the system version (GetVersionInfo, GetVersionInfoFromSystem)", VersionSystem},
    {"release", "[SYSTEM]", "print the release version (GetVersionInfo, GetVersionInfoFromSystem)",
     VersionRelease},
    {"name", "", "print the version name (GetVersionName)", VersionName},
    {"product", "PRODUCT", "print a product's version name (GetProductVersionName)", VersionProduct},
};
constexpr VerbEntry kError[] = {{"", "",
                                "print the object's last-error text (GetLastErrorInfo); most useful in a batch, "
                                "after a failing command",
                                LastError}};

}  // namespace

std::span<const GroupEntry> IdentityGroups() {
    static constexpr GroupEntry kGroups[] = {
        {"name", "The controller's name", kName},
        {"id", "The controller identifier", kId},
        {"language", "The controller's language", kLanguage},
        {"guid", "The system GUID", kGuid},
        {"env", "Environment variables of the controller", kEnvironment},
        {"option", "Installed options", kOption},
        {"clients", "Connected API clients", kClients},
        {"energy", "The system energy state", kEnergy},
        {"link", "The file transfer link", kLink},
        {"version", "Version information", kVersion},
        {"error", "The object's last-error text", kError},
    };
    return kGroups;
}

}  // namespace tavctl
