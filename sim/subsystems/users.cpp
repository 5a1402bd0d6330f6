// Users, manual-mode privileges and mastership.
#include "sim/subsystems/users.h"

#include "sim/arguments.h"
#include "sim/command_table.h"
#include "sim/status_codes.h"

namespace tav::sim {
namespace users {
namespace {

constexpr TextView kResourceNames[] = {OLESTR("KESTO"), OLESTR("CFG"), OLESTR("MOTION"), OLESTR("INFOSTREAM")};
constexpr TextView kGrants = OLESTR("UAS_CONTROLLER_PROPERTIES,UAS_EXECUTE_PROGRAM,UAS_MODIFY_CONFIG,"
                                    "UAS_MODIFY_PROGRAM,UAS_BACKUP_SAVE,UAS_RESTORE,UAS_SAFETY_SERVICES");

UsersState& Users(ModelState& state) { return state.Part<UsersState>(); }
const UsersState& Users(const ModelState& state) { return state.Part<UsersState>(); }

// The client whose identity a client acts with: the impersonated one, or itself.
std::uint32_t ActingAs(const UsersState& users, std::uint32_t clientId) {
    const auto found = users.acting.find(clientId);
    return found == users.acting.end() ? clientId : found->second;
}

const Logon* LogonOf(const UsersState& users, std::uint32_t clientId) {
    const auto found = users.logons.find(clientId);
    return found == users.logons.end() ? nullptr : &found->second;
}

Text Who(const Logon* logon) {
    static const Logon nobody;
    const Logon& who = logon == nullptr ? nobody : *logon;
    return Concat({OLESTR(" -Alias "), Quoted(who.alias), OLESTR(" -Location "), Quoted(who.location),
                   OLESTR(" -Application "), Quoted(who.application)});
}

std::optional<Resource> ResourceOf(const Arguments& arguments) {
    if (const auto number = arguments.Signed(OLESTR("-Resource")); number && *number >= 0 && *number <= 3) {
        return static_cast<Resource>(*number);
    }
    if (const auto word = arguments.Find(OLESTR("-Domain"))) {
        for (int i = 0; i < 4; ++i) {
            if (*word == kResourceNames[i]) {
                return static_cast<Resource>(i);
            }
        }
    }
    return std::nullopt;
}

Text MasterText(const UsersState& users, Resource resource) {
    const std::uint32_t holder = users.masters[static_cast<int>(resource)];
    const Logon* logon = holder == 0 ? nullptr : LogonOf(users, holder);
    const int status = holder == 0 ? 0 : (logon != nullptr && logon->local ? 2 : 1);
    return Concat({OLESTR("-Status "), Decimal(status), OLESTR(" -Cid "), Decimal(holder), Who(logon)});
}

Text PrivilegeStateText(const UsersState& users) {
    const ManualModePrivilege& privilege = users.privilege;
    return Concat({OLESTR("-State "), Decimal(static_cast<int>(privilege.state)), OLESTR(" -Cid "),
                   Decimal(privilege.clientId), Who(LogonOf(users, privilege.clientId))});
}

Text PendingRequestText(const UsersState& users) {
    const ManualModePrivilege& privilege = users.privilege;
    const bool pending = privilege.state == PrivilegeState::PendingModify;
    const Logon* logon = pending ? LogonOf(users, privilege.clientId) : nullptr;
    return Concat({OLESTR("-UserId "), Decimal(logon == nullptr ? 0u : logon->userId), OLESTR(" -Priv "),
                   Decimal(pending ? static_cast<int>(privilege.asked) : 0), Who(logon)});
}

// Everything a client held goes when it logs off or goes away.
void DropHoldings(UsersState& users, std::uint32_t clientId) {
    for (std::uint32_t& holder : users.masters) {
        if (holder == clientId) {
            holder = 0;
        }
    }
    if (users.privilege.clientId == clientId) {
        users.privilege = {};
    }
}

Reply NotLoggedOn(TextView command) { return Refuse(kStatusNotAllowed, Text(command) + OLESTR(": no user is logged on")); }

Reply LogonUser(ControllerModel& controller, const Command& command) {
    const auto arguments = Arguments::Parse(command.args);
    const bool local = arguments && arguments->Signed(OLESTR("-Local")).value_or(0) != 0;
    return controller.Update([&](ModelState& state, EventPosts&) {
        UsersState& users = Users(state);
        const std::uint32_t client = command.caller.clientId;
        auto [entry, added] = users.logons.try_emplace(client);
        if (added) {
            entry->second.userId = users.nextUserId++;
            entry->second.alias = OLESTR("Default User");
            entry->second.location = OLESTR("Pendant ") + Decimal(client);
            entry->second.application = OLESTR("TavController");
        }
        entry->second.local = local;
        return Answer(Concat({OLESTR("-UserId "), Decimal(entry->second.userId), OLESTR(" -Cid "), Decimal(client)}));
    });
}

Reply Logoff(ControllerModel& controller, const Command& command) {
    return controller.Update([&](ModelState& state, EventPosts&) {
        UsersState& users = Users(state);
        const std::uint32_t client = command.caller.clientId;
        if (users.logons.erase(client) == 0) {
            return NotLoggedOn(command.name);
        }
        DropHoldings(users, client);
        users.acting.erase(client);
        return Done();
    });
}

Reply GetUserId(ControllerModel& controller, const Command& command) {
    return controller.Read([&](const ModelState& state) {
        const UsersState& users = Users(state);
        const std::uint32_t client = ActingAs(users, command.caller.clientId);
        const Logon* logon = LogonOf(users, client);
        if (logon == nullptr) {
            return NotLoggedOn(command.name);
        }
        return Answer(Concat({OLESTR("-UserId "), Decimal(logon->userId), OLESTR(" -Cid "), Decimal(client)}));
    });
}

Reply UserGrants(ControllerModel& controller, const Command& command) {
    const bool loggedOn = controller.Read(
        [&](const ModelState& state) { return LogonOf(Users(state), command.caller.clientId) != nullptr; });
    return loggedOn ? Answer(Text(kGrants)) : NotLoggedOn(command.name);
}

Reply Impersonate(ControllerModel& controller, const Command& command) {
    const auto arguments = Arguments::Parse(command.args);
    const auto userId = arguments ? arguments->Unsigned(OLESTR("-UserId")) : std::nullopt;
    if (!userId) {
        return BadArguments(command, OLESTR("-UserId <id>"));
    }
    return controller.Update([&](ModelState& state, EventPosts&) {
        UsersState& users = Users(state);
        if (LogonOf(users, command.caller.clientId) == nullptr) {
            return NotLoggedOn(command.name);
        }
        for (const auto& [client, logon] : users.logons) {
            if (logon.userId == *userId) {
                if (client == command.caller.clientId) {
                    users.acting.erase(client);
                } else {
                    users.acting[command.caller.clientId] = client;
                }
                return Answer(OLESTR("-Cid ") + Decimal(client));
            }
        }
        return Refuse(kStatusNotFound, OLESTR("Impersonate: no user with id ") + Decimal(*userId) +
                                           OLESTR(" is logged on"));
    });
}

Reply RemoveImpersonation(ControllerModel& controller, const Command& command) {
    return controller.Update([&](ModelState& state, EventPosts&) {
        if (Users(state).acting.erase(command.caller.clientId) == 0) {
            return Refuse(kStatusNotAllowed, OLESTR("RemoveImpersonation: the client impersonates nobody"));
        }
        return Done();
    });
}

Reply RequestMastership(ControllerModel& controller, const Command& command) {
    const auto arguments = Arguments::Parse(command.args);
    const auto resource = arguments ? ResourceOf(*arguments) : std::nullopt;
    if (!resource) {
        return Refuse(kStatusBadArgument, OLESTR("MastershipRequest: unknown resource ") + Quoted(command.args));
    }
    return controller.Update([&](ModelState& state, EventPosts&) {
        UsersState& users = Users(state);
        const std::uint32_t client = ActingAs(users, command.caller.clientId);
        if (LogonOf(users, client) == nullptr) {
            return NotLoggedOn(command.name);
        }
        std::uint32_t& holder = users.masters[static_cast<int>(*resource)];
        if (holder != 0 && holder != client) {
            const Logon* other = LogonOf(users, holder);
            return Refuse(kStatusNotAllowed,
                          Concat({OLESTR("MastershipRequest: "), kResourceNames[static_cast<int>(*resource)],
                                  OLESTR(" is held by "), other == nullptr ? Text() : other->alias, OLESTR(" at "),
                                  other == nullptr ? Text() : other->location}));
        }
        holder = client;
        return Done();
    });
}

Reply ReleaseMastership(ControllerModel& controller, const Command& command) {
    const auto arguments = Arguments::Parse(command.args);
    const auto resource = arguments ? ResourceOf(*arguments) : std::nullopt;
    if (!resource) {
        return Refuse(kStatusBadArgument, OLESTR("MastershipRelease: unknown resource ") + Quoted(command.args));
    }
    return controller.Update([&](ModelState& state, EventPosts&) {
        UsersState& users = Users(state);
        std::uint32_t& holder = users.masters[static_cast<int>(*resource)];
        if (holder == 0 || holder != ActingAs(users, command.caller.clientId)) {
            return Refuse(kStatusNotAllowed, Concat({OLESTR("MastershipRelease: "),
                                                     kResourceNames[static_cast<int>(*resource)],
                                                     OLESTR(" is not held by this client")}));
        }
        holder = 0;
        return Done();
    });
}

Reply CurrentMaster(ControllerModel& controller, const Command& command) {
    const auto arguments = Arguments::Parse(command.args);
    const auto resource = arguments ? ResourceOf(*arguments) : std::nullopt;
    if (!resource) {
        return Refuse(kStatusBadArgument, OLESTR("CurrentMaster: unknown resource ") + Quoted(command.args));
    }
    return Answer(controller.Read([&](const ModelState& state) { return MasterText(Users(state), *resource); }));
}

Reply RequestPrivilege(ControllerModel& controller, const Command& command) {
    const auto arguments = Arguments::Parse(command.args);
    const auto priv = arguments ? arguments->Signed(OLESTR("-Priv")) : std::nullopt;
    if (!priv || (*priv != 1 && *priv != 2)) {
        return BadArguments(command, OLESTR("-Priv 1 or 2"));
    }
    return controller.Update([&](ModelState& state, EventPosts& posts) {
        UsersState& users = Users(state);
        const std::uint32_t client = command.caller.clientId;
        if (LogonOf(users, client) == nullptr) {
            return NotLoggedOn(command.name);
        }
        if (state.mode == OperationMode::Auto) {
            return Refuse(kStatusNotAllowed, OLESTR("RMMPRequest: manual-mode privileges are not given in AUTO"));
        }
        ManualModePrivilege& privilege = users.privilege;
        if (privilege.clientId != 0 && privilege.clientId != client) {
            return Refuse(kStatusNotAllowed, OLESTR("RMMPRequest: another client holds or asks for privileges"));
        }
        privilege = {client, static_cast<Privilege>(*priv), PrivilegeState::PendingModify};
        posts.Post(OLESTR("RMMPRequest"), PendingRequestText(users));
        return Done();
    });
}

Reply PollRequest(ControllerModel& controller, const Command& command) {
    return controller.Read([&](const ModelState& state) {
        const ManualModePrivilege& privilege = Users(state).privilege;
        if (privilege.clientId != command.caller.clientId) {
            return Refuse(kStatusNotFound, OLESTR("RMMPPoll: the client has no active request"));
        }
        return Done();
    });
}

Reply CancelPrivilege(ControllerModel& controller, const Command& command) {
    return controller.Update([&](ModelState& state, EventPosts&) {
        UsersState& users = Users(state);
        if (users.privilege.clientId != command.caller.clientId) {
            return Refuse(kStatusNotAllowed, OLESTR("RMMPCancel: the client holds and asks for no privileges"));
        }
        users.privilege = {};
        return Done();
    });
}

Reply GrantPrivilege(ControllerModel& controller, const Command& command) {
    const auto arguments = Arguments::Parse(command.args);
    const auto userId = arguments ? arguments->Unsigned(OLESTR("-UserId")) : std::nullopt;
    const auto priv = arguments ? arguments->Signed(OLESTR("-Priv")) : std::nullopt;
    if (!userId || !priv || *priv < 0 || *priv > 2) {
        return BadArguments(command, OLESTR("-UserId <id> -Priv 0..2"));
    }
    const auto grantee = *userId;
    const auto level = *priv;
    return controller.Update([&](ModelState& state, EventPosts&) {
        UsersState& users = Users(state);
        if (LogonOf(users, command.caller.clientId) == nullptr) {
            return NotLoggedOn(command.name);
        }
        ManualModePrivilege& privilege = users.privilege;
        const Logon* requester = LogonOf(users, privilege.clientId);
        if (privilege.state != PrivilegeState::PendingModify || requester == nullptr ||
            requester->userId != grantee) {
            return Refuse(kStatusNotFound, OLESTR("RMMPGrant: user ") + Decimal(grantee) +
                                               OLESTR(" has no pending request"));
        }
        if (privilege.clientId == command.caller.clientId) {
            return Refuse(kStatusNotAllowed, OLESTR("RMMPGrant: a request is granted by another client"));
        }
        if (level == 0) {
            privilege = {};  // refused
        } else {
            privilege.state = level == 2 ? PrivilegeState::Exec : PrivilegeState::Modify;
        }
        return Done();
    });
}

Reply GetPrivilegeState(ControllerModel& controller, const Command&) {
    return Answer(controller.Read([](const ModelState& state) { return PrivilegeStateText(Users(state)); }));
}

Reply PendingRequest(ControllerModel& controller, const Command&) {
    return Answer(controller.Read([](const ModelState& state) { return PendingRequestText(Users(state)); }));
}

Reply UasUsers(ControllerModel& controller, const Command&) {
    return Answer(controller.Read([](const ModelState& state) {
        Text list = OLESTR("Admin;Operator;Service");
        for (const auto& [client, logon] : Users(state).logons) {
            list += Concat({OLESTR(";"), logon.alias, OLESTR("@"), logon.location});
        }
        return list;
    }));
}

Reply UasGrants(ControllerModel&, const Command&) { return Answer(Text(kGrants)); }

Text MasterEvent(const ModelState& state, const Arguments& eventArgs) {
    return MasterText(Users(state), ResourceOf(eventArgs).value_or(Resource::Kesto));
}

Text PrivilegeStateEvent(const ModelState& state, const Arguments&) { return PrivilegeStateText(Users(state)); }

void ClientGone(ModelState& state, std::uint32_t clientId) {
    UsersState& users = Users(state);
    users.logons.erase(clientId);
    users.acting.erase(clientId);
    std::erase_if(users.acting, [clientId](const auto& entry) { return entry.second == clientId; });
    DropHoldings(users, clientId);
}

constexpr CommandRow kRows[] = {
    {OLESTR("Set"), OLESTR("UserLogon"), LogonUser},
    {OLESTR("Set"), OLESTR("UserLogoff"), Logoff},
    {OLESTR("Get"), OLESTR("UserId"), GetUserId},
    {OLESTR("Get"), OLESTR("UserGrants"), UserGrants},
    {OLESTR("Set"), OLESTR("Impersonate"), Impersonate},
    {OLESTR("Set"), OLESTR("RemoveImpersonation"), RemoveImpersonation},
    {OLESTR("Set"), OLESTR("MastershipRequest"), RequestMastership},
    {OLESTR("Set"), OLESTR("MastershipRelease"), ReleaseMastership},
    {OLESTR("Get"), OLESTR("CurrentMaster"), CurrentMaster},
    {OLESTR("Set"), OLESTR("RMMPRequest"), RequestPrivilege},
    {OLESTR("Set"), OLESTR("RMMPPoll"), PollRequest},
    {OLESTR("Set"), OLESTR("RMMPCancel"), CancelPrivilege},
    {OLESTR("Set"), OLESTR("RMMPGrant"), GrantPrivilege},
    {OLESTR("Get"), OLESTR("RMMPState"), GetPrivilegeState},
    {OLESTR("Get"), OLESTR("RMMPPending"), PendingRequest},
    {OLESTR("Get"), OLESTR("UASUsers"), UasUsers},
    {OLESTR("Get"), OLESTR("UASGrants"), UasGrants},
};

// "CurrentMasterUid" takes "-Domain KESTO|CFG|MOTION"; "RMMPRequest" is
// posted with each request.
constexpr EventRow kEvents[] = {
    {OLESTR("CurrentMasterUid"), EventStyle::Value, MasterEvent},
    {OLESTR("RMMPRequest"), EventStyle::Pulse, nullptr},
    {OLESTR("RMMPStateUid"), EventStyle::Value, PrivilegeStateEvent},
};

}  // namespace
}  // namespace users

const Subsystem& UsersSubsystem() {
    static constexpr Subsystem subsystem{users::kRows, users::kEvents, users::ClientGone};
    return subsystem;
}

}  // namespace tav::sim
