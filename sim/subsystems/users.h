#pragma once
#include <array>
#include <cstdint>
#include <map>

#include "sim/text.h"

// Users, manual-mode privileges and mastership of the controller's
// resources, as the user component asks for them with commands of its own.
// The replies and event texts (all "-Key value" pairs, texts quoted):
//   logon / user id   "-UserId <u> -Cid <client>"
//   impersonation     "-Cid <client>"
//   current master    "-Status <s> -Cid <client> -Alias \"..\" -Location \"..\" -Application \"..\""
//                     (status 0 none, 1 held remote, 2 held local)
//   privilege request "-UserId <u> -Priv <p> -Alias \"..\" -Location \"..\" -Application \"..\""
//                     (also the RMMPRequest event; -UserId 0 -Priv 0 when none is pending)
//   privilege state   "-State <s> -Cid <client> -Alias \"..\" -Location \"..\" -Application \"..\""
//                     (also the RMMPStateUid event; state 0 none, 1 modify, 2 execute,
//                     3 modify pending)
//   user grants       the grant names, comma-separated
namespace tav::sim::users {

enum class Resource { Kesto = 0, Cfg = 1, Motion = 2, InfoStream = 3 };
enum class Privilege { None = 0, Modify = 1, Exec = 2 };
enum class PrivilegeState { None = 0, Modify = 1, Exec = 2, PendingModify = 3 };

struct Logon {
    std::uint32_t userId = 0;
    Text alias;
    Text location;
    Text application;
    bool local = false;
};

// The privilege asked for or held in manual mode: one client at a time.
struct ManualModePrivilege {
    std::uint32_t clientId = 0;  // 0: nobody
    Privilege asked = Privilege::None;
    PrivilegeState state = PrivilegeState::None;
};

struct UsersState {
    std::map<std::uint32_t, Logon> logons;              // by client
    std::map<std::uint32_t, std::uint32_t> acting;      // client -> client it impersonates
    std::array<std::uint32_t, 4> masters{};             // client holding each resource, 0: none
    ManualModePrivilege privilege;
    std::uint32_t nextUserId = 100;
};

}  // namespace tav::sim::users
