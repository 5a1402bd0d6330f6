#pragma once
// A controller object on a fresh virtual controller whose jobs take a few
// milliseconds, with a hand on the controller's file system and commands.
#include <chrono>
#include <string>
#include <thread>

#include "e2e_events/events_fixture.h"
#include "sim/file_system.h"
#include "sim/subsystems/devices.h"
#include "sim/subsystems/system_jobs.h"

namespace tav::e2e {

using namespace std::chrono_literals;

class SystemFixture : public EventsFixture {
protected:
    void SetUp() override {
        EventsFixture::SetUp();
        for (auto job : {sim::jobs::Job::Backup, sim::jobs::Job::Diagnostics, sim::jobs::Job::ScreenDump,
                         sim::jobs::Job::Inbox}) {
            sim::jobs::SetDuration(*Model(), job, 20ms);
        }
    }

    bool Exists(const std::string& path) {
        return Model()->Read([&](const sim::ModelState& s) { return s.Part<sim::FileSystem>().Exists(sim::Widen(path)); });
    }
    // The file's bytes; "<none>" for no file.
    std::string Read(const std::string& path) {
        return Model()->Read([&](const sim::ModelState& s) {
            const std::string* bytes = s.Part<sim::FileSystem>().Read(sim::Widen(path));
            return bytes ? *bytes : std::string("<none>");
        });
    }
    void Write(const std::string& path, const std::string& bytes) {
        Model()->Update([&](sim::ModelState& s, sim::EventPosts&) {
            ASSERT_EQ(s.Part<sim::FileSystem>().Write(sim::Widen(path), bytes), sim::FileSystem::Result::Done) << path;
        });
    }

    // Long enough that a test sees a job still running however loaded the
    // machine (sanitizers, qemu, Wine), short enough to wait for.
    static constexpr std::chrono::milliseconds kLongJob = 2500ms;

    template <typename F>
    static bool WaitUntil(F done, std::chrono::milliseconds limit = 20s) {
        const auto end = std::chrono::steady_clock::now() + limit;
        while (!done()) {
            if (std::chrono::steady_clock::now() > end) {
                return false;
            }
            std::this_thread::sleep_for(2ms);
        }
        return true;
    }
};

}  // namespace tav::e2e
