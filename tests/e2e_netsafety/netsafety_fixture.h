#pragma once
#include "e2e_events/events_fixture.h"

namespace tav::e2e {

using NetSafetyFixture = EventsFixture;

}  // namespace tav::e2e
