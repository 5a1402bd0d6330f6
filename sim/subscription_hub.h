#pragma once
#include <chrono>
#include <condition_variable>
#include <deque>
#include <map>
#include <memory>
#include <mutex>
#include <thread>

#include "TavController.h"
#include "sim/controller_model.h"
#include "sim/event_table.h"
#include "tav/com_ptr.h"

namespace tav::sim {

struct SubscriptionRequest {
    const EventRow* event = nullptr;
    Arguments eventArgs;
    ComPtr<_ITavObjectEvents> sink;
    ULONG pollTime = 0;  // milliseconds; 0x7FFFFFFF and above: never polled
    ULONG userDef = 0;
    TavContainData containData = Data;
    LONG kind = 0;
};

// The subscriptions of one command component on its controller, and the
// thread that delivers their events through _ITavObjectEvents::OnChange.
// A value event is queued whenever its text differs from the one queued last,
// looked at right after every change of the controller (so that quick
// successive changes each give an event) and every poll period; a pulse event
// each time it is posted. Each subscription's events go out in order; sinks
// are called without any lock held.
class SubscriptionHub : public ModelListener, public std::enable_shared_from_this<SubscriptionHub> {
public:
    explicit SubscriptionHub(std::shared_ptr<ControllerModel> controller);
    ~SubscriptionHub() override;

    ControllerModel& Controller() const { return *controller_; }

    // The new subscription's cookie (never 0); 0 once stopped.
    ULONG Add(SubscriptionRequest request);

    // False for an unknown cookie. When it returns, the sink is no longer
    // called (unless Remove runs inside that sink's own OnChange).
    bool Remove(ULONG cookie);

    // Ends all subscriptions and the thread.
    void Stop();

    void OnModelChanged() override;
    void OnModelEvent(TextView eventName, TextView text) override;

private:
    struct Subscription;
    struct Delivery;

    void Run();
    // Queues the value events whose text changed; under mutex_. With
    // `dueOnly`, only the subscriptions whose poll period has come.
    void QueueChangedValues(bool dueOnly, std::chrono::steady_clock::time_point now);
    bool TakeDelivery(Delivery& delivery);
    std::chrono::steady_clock::time_point NextPoll() const;
    void Send(Delivery& delivery, TextView text);

    const std::shared_ptr<ControllerModel> controller_;
    mutable std::mutex mutex_;
    std::condition_variable wake_;
    std::condition_variable delivered_;
    std::map<ULONG, Subscription> subscriptions_;
    ULONG nextCookie_ = 1;
    ULONG lastServed_ = 0;
    ULONG delivering_ = 0;
    ULONG nextEventId_ = 1;
    bool stopping_ = false;
    bool listening_ = false;
    std::thread thread_;
};

}  // namespace tav::sim
