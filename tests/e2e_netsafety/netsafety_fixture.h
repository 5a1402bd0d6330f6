#pragma once
// A controller object of the newest class on a fresh virtual controller, with
// a hand on that controller's model and its wire for what the module's
// checks would stop before it (texts the controller itself must refuse).
#include <string>

#include "e2e_events/events_fixture.h"
#include "sim/command_table.h"
#include "sim/status_codes.h"

namespace tav::e2e {

class NetSafetyFixture : public EventsFixture {
protected:
    sim::Reply Send(const char* verb, const char* name, const std::string& args = {}) {
        const sim::Text v = sim::Widen(verb), n = sim::Widen(name), a = sim::Widen(args);
        return sim::Dispatch(*Model(), {v, n, a, Url()});
    }
    static std::string TextOf(const sim::Reply& reply) { return sim::Narrow(reply.text); }
    static Bstr Wide(const std::string& text) { return Bstr(text::Widen(text).c_str()); }
    bool ErrorHas(const std::string& part) { return LastError().find(part) != std::string::npos; }
};

}  // namespace tav::e2e
