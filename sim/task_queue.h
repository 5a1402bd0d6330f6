#pragma once
#include <chrono>
#include <cstddef>
#include <condition_variable>
#include <deque>
#include <functional>
#include <memory>
#include <mutex>
#include <thread>

namespace tav::sim {

// A worker thread that runs posted tasks one after the other. Stopping drops
// the tasks not yet started, cuts short a task's Sleep and joins the thread;
// the thread is started by the first Post.
class TaskQueue {
public:
    // Tasks learn from their Sleep whether the queue is stopping.
    class Context {
    public:
        // Waits `duration`; false when the queue stopped meanwhile.
        bool Sleep(std::chrono::milliseconds duration) const;

    private:
        friend class TaskQueue;
        struct State;
        explicit Context(State& state) : state_(state) {}
        State& state_;
    };
    using Task = std::function<void(const Context&)>;

    TaskQueue();
    ~TaskQueue();
    TaskQueue(const TaskQueue&) = delete;
    TaskQueue& operator=(const TaskQueue&) = delete;

    // False once stopped.
    bool Post(Task task);

    // Post, unless `limit` tasks are already waiting.
    enum class Posted { Yes, Full, Stopping };
    Posted PostUnlessFull(Task task, std::size_t limit);

    // May be called from a task: the thread then finishes on its own.
    void Stop();

private:
    std::shared_ptr<Context::State> state_;
    std::thread thread_;
    std::mutex threadMutex_;
};

}  // namespace tav::sim
