#pragma once
#include <memory>
#include <mutex>
#include <type_traits>
#include <utility>
#include <vector>

#include "sim/client_links.h"
#include "sim/faults.h"
#include "sim/model_state.h"

namespace tav::sim {

// Pulse events raised while the model changes: each one is delivered to its
// subscribers as it was posted, even if the same text comes twice.
class EventPosts {
public:
    void Post(TextView eventName, Text text) { posts_.emplace_back(Text(eventName), std::move(text)); }
    const std::vector<std::pair<Text, Text>>& All() const { return posts_; }

private:
    std::vector<std::pair<Text, Text>> posts_;
};

// Told of every change of a controller, outside the controller's lock.
class ModelListener {
public:
    virtual ~ModelListener() = default;
    // Something changed; subscribers of value events look again.
    virtual void OnModelChanged() = 0;
    virtual void OnModelEvent(TextView eventName, TextView text) = 0;
};

// One virtual controller: its state, its fault switches and the listeners
// that subscriptions hang on it. Thread-safe; nothing is called while its lock
// is held except the function given to Read or Update.
class ControllerModel {
public:
    // url is the controller's own URL ("/sim"), its name the text after the slash.
    explicit ControllerModel(TextView url);
    ControllerModel(const ControllerModel&) = delete;
    ControllerModel& operator=(const ControllerModel&) = delete;

    const Text& Url() const { return url_; }
    FaultSwitches& Faults() { return faults_; }
    ClientLinks& Links() { return links_; }

    // A subsystem's object that lives as long as the controller, outside the
    // model's lock and untouched by Reset: for state on a hot path that keeps
    // a lock of its own (message routing). Made on first use.
    template <typename T>
    T& Shared() {
        std::lock_guard lock(sharedMutex_);
        return shared_.Get<T>();
    }

    // Calls read(const ModelState&) under the lock and returns what it returns.
    template <typename F>
    decltype(auto) Read(F&& read) const {
        std::lock_guard lock(mutex_);
        return read(static_cast<const ModelState&>(state_));
    }

    // Calls change(ModelState&, EventPosts&) under the lock, then tells the
    // listeners, and returns what change returned. Changes are told in the
    // order they were made, each before the next one is made: a value event
    // sees every state a change left, even when a second change follows at
    // once from another thread, and pulse events keep their order.
    template <typename F>
    decltype(auto) Update(F&& change) {
        std::lock_guard order(publishMutex_);
        EventPosts posts;
        using Result = std::invoke_result_t<F, ModelState&, EventPosts&>;
        if constexpr (std::is_void_v<Result>) {
            {
                std::lock_guard lock(mutex_);
                change(state_, posts);
            }
            Publish(posts);
        } else {
            std::unique_lock lock(mutex_);
            Result result = change(state_, posts);
            lock.unlock();
            Publish(posts);
            return result;
        }
    }

    // The controller's clock: the host clock plus the offset that a clock
    // setting left, in seconds since 1970-01-01 UTC, within 32 bits.
    static std::uint32_t Now(const ModelState& state);
    std::uint32_t Now() const;

    // A controller as it was when first reached, fault switches off.
    // Connected clients and listeners stay.
    void Reset();

    // Connected clients, as the ConnectedClients reply lists them.
    std::uint32_t ConnectClient(TextView application);
    void DisconnectClient(std::uint32_t id);

    void AddListener(const std::shared_ptr<ModelListener>& listener);
    void RemoveListener(const ModelListener* listener);

    // Conveniences for hosts and tests; each a one-line Update.
    bool SetMotorsState(TextView word);  // false for a word not of IsMotorsStateWord
    void SetMode(OperationMode mode);    // as is, without a condition list
    void SetAutoConditions(std::vector<AutoCondition> conditions);
    void TriggerCollision();             // motors stop, collision TRIGGERED
    void SetEnergyState(TextView word);

    // Pulse events of the connection itself, for SubscribeConnectionEvents.
    static constexpr const OLECHAR* kConnectionEvent = OLESTR("Connection");

private:
    void Publish(const EventPosts& posts);

    const Text url_;
    mutable std::mutex mutex_;
    ModelState state_;
    FaultSwitches faults_;
    ClientLinks links_;
    std::mutex sharedMutex_;
    StateParts shared_;

    // Taken before mutex_ and held until the listeners have been told.
    std::mutex publishMutex_;
    std::mutex listenersMutex_;
    std::vector<std::weak_ptr<ModelListener>> listeners_;
};

}  // namespace tav::sim
