#pragma once
// Work of the system management that takes time on a controller: a backup,
// a diagnostics file, a screen dump, an inbox operation. The command that
// starts one is answered at once; the work ends later, under the model's
// lock, on a worker of its own kind, so that a long backup does not hold up
// a screen dump.
#include <array>
#include <atomic>
#include <chrono>
#include <cstdint>
#include <functional>
#include <utility>

#include "sim/controller_model.h"
#include "sim/task_queue.h"

namespace tav::sim::jobs {

enum class Job : std::size_t { Backup, Diagnostics, ScreenDump, Inbox, Count };

// How long each kind of job takes on this controller.
struct Durations {
    std::array<std::chrono::milliseconds, static_cast<std::size_t>(Job::Count)> of{
        std::chrono::milliseconds(1500), std::chrono::milliseconds(500), std::chrono::milliseconds(300),
        std::chrono::milliseconds(300)};
};

// Tickets are unique for the life of the process, so that a job started
// before a controller was reset finds that it no longer belongs to it.
inline std::uint64_t NextTicket() {
    static std::atomic<std::uint64_t> next{1};
    return next++;
}

struct Workers {
    std::array<TaskQueue, static_cast<std::size_t>(Job::Count)> of;
};

using Finish = std::function<void(ModelState& state, EventPosts& posts)>;

// Runs `finish` under the model's lock when the job's time has passed; it
// checks its own ticket. Called outside the model's lock.
inline void FinishLater(ControllerModel& controller, Job job, Finish finish) {
    const auto index = static_cast<std::size_t>(job);
    const std::chrono::milliseconds duration =
        controller.Read([&](const ModelState& state) { return state.Part<Durations>().of[index]; });
    controller.Shared<Workers>().of[index].Post(
        [&controller, duration, finish = std::move(finish)](const TaskQueue::Context& context) {
            if (context.Sleep(duration)) {
                controller.Update(finish);
            }
        });
}

// Demo switch: how long a kind of job takes from now on.
inline void SetDuration(ControllerModel& controller, Job job, std::chrono::milliseconds duration) {
    controller.Update([&](ModelState& state, EventPosts&) {
        state.Part<Durations>().of[static_cast<std::size_t>(job)] = duration;
    });
}

}  // namespace tav::sim::jobs
