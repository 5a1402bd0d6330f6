#pragma once
#include <cstdint>

#include "sim/model_state.h"

// Reply texts that more than one command or event carries.
namespace tav::sim {

// "-time_t " and the seconds.
Text ClockText(std::uint32_t seconds);

// The condition list: "-auto_ch %d -noelts %d" and a TAB, then per pending
// condition "name;keep;id" and a TAB. The flag is 1 while a change to
// automatic is pending.
Text AutoConditionList(const ModelState& state);

// The mode word; while a change to automatic is pending, "AUTO_CH", a blank
// and the condition list.
Text ModeText(const ModelState& state);

// The connected API clients as an XML document.
Text ConnectedClientsXml(const ModelState& state);

}  // namespace tav::sim
