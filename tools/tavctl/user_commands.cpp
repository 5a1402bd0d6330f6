// Users, manual-mode privileges, mastership and the user authorisation
// system's lists.
#include "tavctl/login_info.h"
#include "tavctl/verb.h"

namespace tavctl {
namespace {

using U = ITavUser;
using U3 = ITavUser3;
using M = ITavMastership;

constexpr EnumName kPrivilegeWords[] = {{TavManualModePrivileges_None, "none"},
                                        {TavManualModePrivileges_Modify, "modify"},
                                        {TavManualModePrivileges_Exec, "exec"}};
constexpr EnumName kResourceWords[] = {
    {ResourceKESTO, "kesto"}, {ResourceCFG, "cfg"}, {ResourceMotion, "motion"}, {ResourceInfoStream, "infostream"}};

TavManualModePrivileges Privileges(Verb& v) {
    const std::string word = v.Word("PRIVILEGES");
    return static_cast<TavManualModePrivileges>(
        v.EnumValue("PRIVILEGES", word, NamesOf<TavManualModePrivileges>(), kPrivilegeWords));
}

TavMastershipResource Resource(Verb& v) {
    const std::string word = v.Word("RESOURCE");
    return static_cast<TavMastershipResource>(
        v.EnumValue("RESOURCE", word, NamesOf<TavMastershipResource>(), kResourceWords));
}

int Logon(Verb& v) {
    const bool local = v.Flag("--local");
    v.End();
    return local ? v.Set("LogonUserAsLocal", &U::LogonUserAsLocal) : v.Set("LogonUser", &U::LogonUser);
}
int Logoff(Verb& v) {
    v.End();
    return v.Set("LogoffUser", &U::LogoffUser);
}
int Id(Verb& v) {
    v.End();
    return v.GetOnly("GetUserId", &U3::GetUserId);
}
int Impersonate(Verb& v) {
    const auto user = v.Number<ULONG>("USERID");
    v.End();
    return v.GetOnly("ImpersonateUser", &U3::ImpersonateUser, user);
}
int Unimpersonate(Verb& v) {
    v.End();
    return v.Set("RemoveImpersonation", &U3::RemoveImpersonation);
}
int Grants(Verb& v) {
    v.End();
    return v.GetOnly("GetUserGrants", &U::GetUserGrants);
}
int UserList(Verb& v) {
    v.End();
    return v.GetOnly("GetUserList", &ITavUAS::GetUserList);
}
int GrantList(Verb& v) {
    v.End();
    return v.GetOnly("GetGrantList", &ITavUAS::GetGrantList);
}

int Request(Verb& v) {
    const auto privileges = Privileges(v);
    v.End();
    return v.Set("RequestManualModePrivileges", &U::RequestManualModePrivileges, privileges);
}
int Poll(Verb& v) {
    v.End();
    return v.Set("PollActiveRequest", &U::PollActiveRequest);
}
int Cancel(Verb& v) {
    v.End();
    return v.Set("CancelManualModePrivileges", &U::CancelManualModePrivileges);
}
int Grant(Verb& v) {
    const auto user = v.Number<ULONG>("USERID");
    const auto privileges = Privileges(v);
    v.End();
    return v.Set("GrantManualModePrivileges", &U::GrantManualModePrivileges, user, privileges);
}
int PrivilegeState(Verb& v) {
    v.End();
    const auto users = v.Interface<U>();
    TavManualModePrivilegesState state = TavManualModePrivilegesState_None;
    LoginInfo user;
    LONG me = 0;
    return v.session.Read(
        "GetManualModePrivilegesState",
        [&](TavInParams* rip) { return users->GetManualModePrivilegesState(rip, &state, user.Out(), &me); }, nullptr,
        [&] {
            Record record{{"state", Show(state)}};
            user.AppendTo(record);
            record.emplace_back("thisIsMe", AsBoolean(me));
            v.session.Show(record);
        });
}
int Pending(Verb& v) {
    v.End();
    const auto users = v.Interface<ITavUser2>();
    LoginInfo user;
    ULONG id = 0;
    TavManualModePrivileges privileges = TavManualModePrivileges_None;
    return v.session.Read(
        "GetPendingManualModePrivRequest",
        [&](TavInParams* rip) { return users->GetPendingManualModePrivRequest(rip, user.Out(), &id, &privileges); },
        [&](VARIANT* data) { return users->UnpackPendingManualModePrivRequest(data, user.Out(), &id, &privileges); },
        [&] {
            Record record{{"userId", Show(id)}, {"privileges", Show(privileges)}};
            user.AppendTo(record);
            v.session.Show(record);
        });
}

int MasterRequest(Verb& v) {
    const auto resource = Resource(v);
    v.End();
    return v.Set("RequestMastership", &M::RequestMastership, resource);
}
int MasterRelease(Verb& v) {
    const auto resource = Resource(v);
    v.End();
    return v.Set("ReleaseMastership", &M::ReleaseMastership, resource);
}
int MasterGet(Verb& v) {
    const auto resource = Resource(v);
    v.End();
    const auto mastership = v.Interface<M>();
    TavMastershipStatus status = TavMastershipStatus_None;
    LoginInfo user;
    LONG me = 0;
    return v.session.Read(
        "GetCurrentMaster",
        [&](TavInParams* rip) { return mastership->GetCurrentMaster(rip, resource, &status, user.Out(), &me); },
        nullptr,
        [&] {
            Record record{{"status", Show(status)}};
            user.AppendTo(record);
            record.emplace_back("thisIsMe", AsBoolean(me));
            v.session.Show(record);
        });
}

constexpr VerbEntry kUser[] = {
    {"logon", "[--local]", "log the user on (LogonUser, LogonUserAsLocal with --local)", Logon},
    {"logoff", "", "log the user off (LogoffUser)", Logoff},
    {"id", "", "print the user's id (GetUserId)", Id},
    {"impersonate", "USERID", "act as another user; prints the client (ImpersonateUser)", Impersonate},
    {"unimpersonate", "", "stop acting as another user (RemoveImpersonation)", Unimpersonate},
    {"grants", "", "print the user's grants (GetUserGrants)", Grants},
    {"list", "", "print the users (GetUserList)", UserList},
};
constexpr VerbEntry kRmmp[] = {
    {"request", "none|modify|exec", "ask for manual-mode privileges (RequestManualModePrivileges)", Request},
    {"poll", "", "poll the active request (PollActiveRequest)", Poll},
    {"cancel", "", "cancel the privileges (CancelManualModePrivileges)", Cancel},
    {"grant", "USERID none|modify|exec", "grant another user's request (GrantManualModePrivileges)", Grant},
    {"state", "", "print the privileges' state (GetManualModePrivilegesState)", PrivilegeState},
    {"pending", "", "print the pending request (GetPendingManualModePrivRequest)", Pending},
};
constexpr VerbEntry kMaster[] = {
    {"request", "RESOURCE", "take mastership of a resource (RequestMastership)", MasterRequest,
     "RESOURCE: kesto, cfg, motion, infostream or a TavMastershipResource name.\n"
     "Two clients show a conflict: tavctl batch with \"--client 2 master request cfg\".\n"},
    {"release", "RESOURCE", "give mastership back (ReleaseMastership)", MasterRelease},
    {"get", "RESOURCE", "print who holds a resource (GetCurrentMaster)", MasterGet},
};
constexpr VerbEntry kUas[] = {
    {"users", "", "print the users (GetUserList)", UserList},
    {"grants", "", "print the grants (GetGrantList)", GrantList},
};

}  // namespace

std::span<const GroupEntry> UserGroups() {
    static constexpr GroupEntry kGroups[] = {
        {"user", "Users", kUser},
        {"rmmp", "Manual-mode privileges", kRmmp},
        {"master", "Mastership", kMaster},
        {"uas", "The user authorisation system", kUas},
    };
    return kGroups;
}

}  // namespace tavctl
