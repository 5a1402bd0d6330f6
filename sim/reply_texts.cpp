#include "sim/reply_texts.h"

namespace tav::sim {

Text ClockText(std::uint32_t seconds) { return OLESTR("-time_t ") + Decimal(seconds); }

Text AutoConditionList(const ModelState& state) {
    const bool pending = state.mode == OperationMode::AutoChange;
    const std::size_t count = pending ? state.pendingConditions.size() : 0;
    Text text = OLESTR("-auto_ch ") + Decimal(pending ? 1 : 0) + OLESTR(" -noelts ") + Decimal(count) + OLESTR("\t");
    for (std::size_t i = 0; i < count; ++i) {
        const AutoCondition& condition = state.pendingConditions[i];
        text += condition.name + OLESTR(";") + Decimal(condition.keep) + OLESTR(";") + Decimal(condition.id) +
                OLESTR("\t");
    }
    return text;
}

Text ModeText(const ModelState& state) {
    Text text(ModeWord(state.mode));
    if (state.mode == OperationMode::AutoChange) {
        text += OLESTR(" ") + AutoConditionList(state);
    }
    return text;
}

Text ConnectedClientsXml(const ModelState& state) {
    Text xml = OLESTR("<?xml version=\"1.0\"?>\n<TavAPIClients count=\"") + Decimal(state.clients.size()) +
               OLESTR("\">\n");
    for (const ConnectedClient& client : state.clients) {
        xml += OLESTR("  <Client id=\"") + Decimal(client.id) + OLESTR("\" application=\"") + client.application +
               OLESTR("\" location=\"local\"/>\n");
    }
    xml += OLESTR("</TavAPIClients>");
    return xml;
}

}  // namespace tav::sim
