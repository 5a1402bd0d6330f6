#include "sim/task_queue.h"

namespace tav::sim {

struct TaskQueue::Context::State {
    std::mutex mutex;
    std::condition_variable wake;
    std::deque<Task> tasks;
    bool stopping = false;

    void Run(const std::shared_ptr<State>& self) {
        const Context context(*self);
        std::unique_lock lock(mutex);
        for (;;) {
            wake.wait(lock, [this] { return stopping || !tasks.empty(); });
            if (stopping) {
                tasks.clear();
                return;
            }
            Task task = std::move(tasks.front());
            tasks.pop_front();
            lock.unlock();
            task(context);
            task = nullptr;  // its captures go before the lock is taken again
            lock.lock();
        }
    }
};

bool TaskQueue::Context::Sleep(std::chrono::milliseconds duration) const {
    std::unique_lock lock(state_.mutex);
    return !state_.wake.wait_for(lock, duration, [this] { return state_.stopping; });
}

TaskQueue::TaskQueue() : state_(std::make_shared<Context::State>()) {}

TaskQueue::~TaskQueue() { Stop(); }

bool TaskQueue::Post(Task task) {
    return PostUnlessFull(std::move(task), static_cast<std::size_t>(-1)) == Posted::Yes;
}

TaskQueue::Posted TaskQueue::PostUnlessFull(Task task, std::size_t limit) {
    {
        std::lock_guard lock(state_->mutex);
        if (state_->stopping) {
            return Posted::Stopping;  // before threadMutex_, which a stopping queue holds while it joins
        }
    }
    std::lock_guard threadLock(threadMutex_);
    {
        std::lock_guard lock(state_->mutex);
        if (state_->stopping) {
            return Posted::Stopping;
        }
        if (state_->tasks.size() >= limit) {
            return Posted::Full;
        }
        state_->tasks.push_back(std::move(task));
    }
    state_->wake.notify_all();
    if (!thread_.joinable()) {
        thread_ = std::thread([state = state_] { state->Run(state); });
    }
    return Posted::Yes;
}

void TaskQueue::Stop() {
    std::deque<Task> dropped;
    {
        std::lock_guard lock(state_->mutex);
        state_->stopping = true;
        dropped.swap(state_->tasks);
    }
    state_->wake.notify_all();
    dropped.clear();
    std::lock_guard lock(threadMutex_);
    if (thread_.joinable()) {
        if (thread_.get_id() == std::this_thread::get_id()) {
            thread_.detach();
        } else {
            thread_.join();
        }
    }
}

}  // namespace tav::sim
