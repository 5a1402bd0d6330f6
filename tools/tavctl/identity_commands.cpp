// Identity, names, version information, environment, options, clients,
// energy state, the file link and the last error.
#include "tavctl/command_support.h"
#include "tavctl/commands.h"
#include "tavctl/names.h"

namespace tavctl {
namespace {

// "get" prints the text that read() produces; "set VALUE" writes it.
int GetOrSet(Session& session, CommandArguments& args, const char* command,
             HRESULT (ITavController::*get)(TavInParams*, BSTR*), HRESULT (ITavController::*unpack)(VARIANT*, BSTR*),
             HRESULT (ITavController::*set)(TavInParams*, BSTR), const char* getName, const char* setName) {
    int status = kExitOk;
    const auto verb = Required(session, args, command, "get or set", status);
    if (!verb) {
        return status;
    }
    ITavController* controller = session.Controller();
    if (*verb == "get") {
        if (!NoMore(session, args, command, status)) {
            return status;
        }
        tav::Bstr value;
        return session.Read(
            getName, [&](TavInParams* rip) { return (controller->*get)(rip, value.Receive()); },
            [&](VARIANT* data) { return (controller->*unpack)(data, value.Receive()); },
            [&] { session.Print(ToUtf8(value)); });
    }
    if (*verb == "set") {
        const auto text = Required(session, args, command, "the new value", status);
        if (!text || !NoMore(session, args, command, status)) {
            return status;
        }
        const tav::Bstr value = ToBstr(*text);
        return session.Write(setName, [&](TavInParams* rip) { return (controller->*set)(rip, value.Get()); });
    }
    return session.Usage(command, "expected get or set, not " + *verb);
}

int Name(Session& session, CommandArguments& args) {
    return GetOrSet(session, args, "name", &ITavController::GetControllerName, &ITavController::UnpackControllerName,
                    &ITavController::SetControllerName, "GetControllerName", "SetControllerName");
}

int Id(Session& session, CommandArguments& args) {
    return GetOrSet(session, args, "id", &ITavController::GetControllerID, &ITavController::UnpackControllerID,
                    &ITavController::SetControllerId, "GetControllerID", "SetControllerId");
}

int Language(Session& session, CommandArguments& args) {
    int status = kExitOk;
    const auto verb = Required(session, args, "language", "set", status);
    if (!verb) {
        return status;
    }
    if (*verb != "set") {
        return session.Usage("language", "expected set, not " + *verb);
    }
    const auto text = Required(session, args, "language", "the language", status);
    if (!text || !NoMore(session, args, "language", status)) {
        return status;
    }
    const auto controller = session.Interface<ITavController2>("ITavController2");
    if (!controller) {
        return kExitFailed;
    }
    const tav::Bstr language = ToBstr(*text);
    return session.Write("SetLanguage", [&](TavInParams* rip) { return controller->SetLanguage(rip, language.Get()); });
}

int Guid(Session& session, CommandArguments& args) {
    int status = kExitOk;
    if (!NoMore(session, args, "guid", status)) {
        return status;
    }
    ITavController* controller = session.Controller();
    tav::Bstr guid;
    return session.Read(
        "GetSystemID", [&](TavInParams* rip) { return controller->GetSystemID(rip, guid.Receive()); },
        [&](VARIANT* data) { return controller->UnpackSystemID(data, guid.Receive()); },
        [&] { session.Print(ToUtf8(guid)); });
}

int Environment(Session& session, CommandArguments& args) {
    int status = kExitOk;
    const auto name = Required(session, args, "env", "the variable's name", status);
    if (!name || !NoMore(session, args, "env", status)) {
        return status;
    }
    ITavController* controller = session.Controller();
    const tav::Bstr variable = ToBstr(*name);
    tav::Bstr value;
    return session.Read(
        "GetEnvironmentVariable",
        [&](TavInParams* rip) { return controller->GetEnvironmentVariable(rip, variable.Get(), value.Receive()); },
        [&](VARIANT* data) { return controller->UnpackEnvironmentVariable(data, value.Receive()); },
        [&] { session.Print(ToUtf8(value)); });
}

int Option(Session& session, CommandArguments& args) {
    int status = kExitOk;
    const auto name = Required(session, args, "option", "the option's name", status);
    if (!name || !NoMore(session, args, "option", status)) {
        return status;
    }
    ITavController* controller = session.Controller();
    const tav::Bstr option = ToBstr(*name);
    LONG present = 0;
    return session.Read(
        "IsOptionPresent", [&](TavInParams* rip) { return controller->IsOptionPresent(rip, option.Get(), &present); },
        [&](VARIANT* data) { return controller->UnpackIsOptionPresent(data, &present); },
        [&] { session.Print(present != 0 ? "present" : "absent"); });
}

int Clients(Session& session, CommandArguments& args) {
    int status = kExitOk;
    if (!NoMore(session, args, "clients", status)) {
        return status;
    }
    const auto controller = session.Interface<ITavController4>("ITavController4");
    if (!controller) {
        return kExitFailed;
    }
    tav::Bstr xml;
    return session.Read(
        "GetConnectedTavAPIClients",
        [&](TavInParams* rip) { return controller->GetConnectedTavAPIClients(rip, xml.Receive()); },
        [&](VARIANT* data) { return controller->UnpackConnectedTavAPIClients(data, xml.Receive()); },
        [&] { session.Print(ToUtf8(xml)); });
}

int Energy(Session& session, CommandArguments& args) {
    int status = kExitOk;
    if (!NoMore(session, args, "energy", status)) {
        return status;
    }
    const auto controller = session.Interface<ITavController4>("ITavController4");
    if (!controller) {
        return kExitFailed;
    }
    TavSysEnergyState state = TavSysEnergyStateNotPaused;
    return session.Read(
        "GetSysEnergyState", [&](TavInParams* rip) { return controller->GetSysEnergyState(rip, &state); },
        [&](VARIANT* data) { return controller->UnpackSysEnergyState(data, &state); },
        [&] { session.Print(NameOf(EnergyStateNames(), state)); });
}

int Link(Session& session, CommandArguments& args) {
    int status = kExitOk;
    if (!NoMore(session, args, "link", status)) {
        return status;
    }
    ITavController* controller = session.Controller();
    status = session.Write("CheckFileTransferLink",
                           [&](TavInParams* rip) { return controller->CheckFileTransferLink(rip); });
    if (status == kExitOk) {
        session.Print("link OK");
    }
    return status;
}

int Version(Session& session, CommandArguments& args) {
    int status = kExitOk;
    const std::string what = args.Done() ? "system" : *args.Next();
    if (what == "system" || what == "release") {
        const TavControllerInfo type = what == "system" ? SystemInfo : ReleaseInfo;
        const auto systemName = args.Next();
        if (!NoMore(session, args, "version", status)) {
            return status;
        }
        ITavController* controller = session.Controller();
        tav::Bstr info;
        if (!systemName) {
            return session.Read(
                "GetVersionInfo", [&](TavInParams* rip) { return controller->GetVersionInfo(rip, type, info.Receive()); },
                [&](VARIANT* data) { return controller->UnpackVersionInfo(data, info.Receive()); },
                [&] { session.Print(ToUtf8(info)); });
        }
        const tav::Bstr system = ToBstr(*systemName);
        return session.Read(
            "GetVersionInfoFromSystem",
            [&](TavInParams* rip) { return controller->GetVersionInfoFromSystem(rip, system.Get(), type, info.Receive()); },
            [&](VARIANT* data) { return controller->UnpackVersionInfo(data, info.Receive()); },
            [&] { session.Print(ToUtf8(info)); });
    }
    if (what == "name") {
        if (!NoMore(session, args, "version", status)) {
            return status;
        }
        const auto controller = session.Interface<ITavController5>("ITavController5");
        if (!controller) {
            return kExitFailed;
        }
        tav::Bstr name;
        return session.Read(
            "GetVersionName", [&](TavInParams* rip) { return controller->GetVersionName(rip, name.Receive()); },
            [&](VARIANT* data) { return controller->UnpackVersionName(data, name.Receive()); },
            [&] { session.Print(ToUtf8(name)); });
    }
    if (what == "product") {
        const auto product = Required(session, args, "version", "the product's name", status);
        if (!product || !NoMore(session, args, "version", status)) {
            return status;
        }
        const auto controller = session.Interface<ITavController6>("ITavController6");
        if (!controller) {
            return kExitFailed;
        }
        const tav::Bstr productName = ToBstr(*product);
        tav::Bstr name;
        return session.Read(
            "GetProductVersionName",
            [&](TavInParams* rip) { return controller->GetProductVersionName(rip, productName.Get(), name.Receive()); },
            [&](VARIANT* data) { return controller->UnpackProductVersionName(data, name.Receive()); },
            [&] { session.Print(ToUtf8(name)); });
    }
    return session.Usage("version", "expected system, release, name or product, not " + what);
}

int LastError(Session& session, CommandArguments& args) {
    int status = kExitOk;
    if (!NoMore(session, args, "error", status)) {
        return status;
    }
    const auto helper = session.Interface<ITavHelperBase>("ITavHelperBase");
    if (!helper) {
        return kExitFailed;
    }
    tav::Bstr text;
    const HRESULT hr = helper->GetLastErrorInfo(text.Receive());
    if (FAILED(hr)) {
        return session.Fail("GetLastErrorInfo", hr);
    }
    session.Print(text.IsNull() ? "(no error recorded)" : ToUtf8(text));
    return kExitOk;
}

constexpr CommandSpec kCommands[] = {
    {"name", "read or set the controller's name",
     "Usage: tavctl name get\n"
     "       tavctl name set NAME\n"
     "GetControllerName / SetControllerName.\n",
     Name},
    {"id", "read or set the controller identifier",
     "Usage: tavctl id get\n"
     "       tavctl id set ID\n"
     "GetControllerID / SetControllerId.\n",
     Id},
    {"language", "set the controller's language",
     "Usage: tavctl language set LANGUAGE\n"
     "SetLanguage (ITavController2).\n",
     Language},
    {"guid", "print the system GUID",
     "Usage: tavctl guid\n"
     "GetSystemID.\n",
     Guid},
    {"env", "print an environment variable of the controller",
     "Usage: tavctl env NAME\n"
     "GetEnvironmentVariable.\n",
     Environment},
    {"option", "tell whether an option is installed",
     "Usage: tavctl option NAME\n"
     "IsOptionPresent; prints present or absent.\n",
     Option},
    {"clients", "list the connected API clients (XML)",
     "Usage: tavctl clients\n"
     "GetConnectedTavAPIClients (ITavController4).\n",
     Clients},
    {"energy", "print the system energy state",
     "Usage: tavctl energy\n"
     "GetSysEnergyState (ITavController4).\n",
     Energy},
    {"link", "check the file transfer link",
     "Usage: tavctl link\n"
     "CheckFileTransferLink.\n",
     Link},
    {"version", "print version information",
     "Usage: tavctl version [system|release] [SYSTEM]\n"
     "       tavctl version name\n"
     "       tavctl version product PRODUCT\n"
     "GetVersionInfo (or GetVersionInfoFromSystem with a system name),\n"
     "GetVersionName (ITavController5), GetProductVersionName (ITavController6).\n",
     Version},
    {"error", "print the object's last-error text",
     "Usage: tavctl error\n"
     "GetLastErrorInfo; most useful in a batch, after a failing command.\n",
     LastError},
};

}  // namespace

std::span<const CommandSpec> IdentityCommands() { return kCommands; }

}  // namespace tavctl
