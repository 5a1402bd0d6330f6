#include "sim/subscription_hub.h"

#include <algorithm>
#include <optional>

#include "tav/variant.h"

namespace tav::sim {
namespace {

using Clock = std::chrono::steady_clock;

constexpr ULONG kNeverPolled = 0x7FFFFFFF;
constexpr std::chrono::milliseconds kShortestPoll(10);

// FILETIME ticks of 1970-01-01 00:00:00 UTC, and per second.
constexpr std::uint64_t kUnixEpochTicks = 116444736000000000ull;
constexpr std::uint64_t kTicksPerSecond = 10000000ull;

FILETIME FileTimeOf(std::uint32_t seconds) {
    const std::uint64_t ticks = kUnixEpochTicks + seconds * kTicksPerSecond;
    FILETIME time;
    time.dwLowDateTime = static_cast<DWORD>(ticks & 0xFFFFFFFFu);
    time.dwHighDateTime = static_cast<DWORD>(ticks >> 32);
    return time;
}

}  // namespace

struct SubscriptionHub::Subscription {
    SubscriptionRequest request;
    Text lastText;
    bool dirty = false;
    std::deque<Text> pulses;
    std::optional<Clock::duration> period;
    Clock::time_point nextPoll;
};

struct SubscriptionHub::Delivery {
    ULONG cookie = 0;
    ComPtr<_ITavObjectEvents> sink;
    const EventRow* event = nullptr;
    Arguments eventArgs;
    ULONG userDef = 0;
    TavContainData containData = Data;
    std::deque<Text> pulses;
    bool lookAtValue = false;
    Text lastText;
    std::optional<Text> newLastText;
};

SubscriptionHub::SubscriptionHub(std::shared_ptr<ControllerModel> controller) : controller_(std::move(controller)) {}

SubscriptionHub::~SubscriptionHub() { Stop(); }

ULONG SubscriptionHub::Add(SubscriptionRequest request) {
    Subscription subscription;
    if (request.event->style == EventStyle::Value) {
        subscription.lastText = controller_->Read(
            [&](const ModelState& state) { return request.event->current(state, request.eventArgs); });
    }
    if (request.pollTime != 0 && request.pollTime < kNeverPolled) {
        subscription.period = std::max(kShortestPoll, std::chrono::milliseconds(request.pollTime));
        subscription.nextPoll = Clock::now() + *subscription.period;
    }
    subscription.request = std::move(request);

    ULONG cookie = 0;
    bool firstListener = false;
    {
        std::lock_guard lock(mutex_);
        if (stopping_) {
            return 0;
        }
        cookie = nextCookie_++;
        if (nextCookie_ == 0) {
            nextCookie_ = 1;
        }
        subscriptions_.emplace(cookie, std::move(subscription));
        firstListener = !listening_;
        listening_ = true;
        if (!thread_.joinable()) {
            thread_ = std::thread([self = shared_from_this()] { self->Run(); });
        }
    }
    wake_.notify_all();
    if (firstListener) {
        controller_->AddListener(shared_from_this());
    }
    return cookie;
}

bool SubscriptionHub::Remove(ULONG cookie) {
    std::optional<Subscription> removed;
    std::unique_lock lock(mutex_);
    const auto found = subscriptions_.find(cookie);
    if (found == subscriptions_.end()) {
        return false;
    }
    removed.emplace(std::move(found->second));
    subscriptions_.erase(found);
    while (delivering_ == cookie && std::this_thread::get_id() != thread_.get_id()) {
        delivered_.wait(lock);
    }
    lock.unlock();
    return true;  // the sink goes with `removed`, outside the lock
}

void SubscriptionHub::Stop() {
    std::map<ULONG, Subscription> ended;
    {
        std::lock_guard lock(mutex_);
        stopping_ = true;
        ended.swap(subscriptions_);
    }
    wake_.notify_all();
    controller_->RemoveListener(this);
    if (thread_.joinable()) {
        if (thread_.get_id() == std::this_thread::get_id()) {
            thread_.detach();
        } else {
            thread_.join();
        }
    }
}

void SubscriptionHub::OnModelChanged() {
    {
        std::lock_guard lock(mutex_);
        for (auto& [cookie, subscription] : subscriptions_) {
            if (subscription.request.event->style == EventStyle::Value) {
                subscription.dirty = true;
            }
        }
    }
    wake_.notify_all();
}

void SubscriptionHub::OnModelEvent(TextView eventName, TextView text) {
    {
        std::lock_guard lock(mutex_);
        for (auto& [cookie, subscription] : subscriptions_) {
            const EventRow& event = *subscription.request.event;
            if (event.style == EventStyle::Pulse && event.name == eventName) {
                subscription.pulses.emplace_back(text);
            }
        }
    }
    wake_.notify_all();
}

void SubscriptionHub::Run() {
    std::unique_lock lock(mutex_);
    while (!stopping_) {
        Delivery delivery;
        if (TakeDelivery(Clock::now(), delivery)) {
            delivering_ = delivery.cookie;
            lock.unlock();
            Deliver(delivery);
            delivery.sink = nullptr;
            lock.lock();
            const auto found = subscriptions_.find(delivery.cookie);
            if (found != subscriptions_.end() && delivery.newLastText) {
                found->second.lastText = std::move(*delivery.newLastText);
            }
            delivering_ = 0;
            delivered_.notify_all();
            continue;
        }
        const Clock::time_point next = NextPoll();
        if (next == Clock::time_point::max()) {
            wake_.wait(lock);
        } else {
            wake_.wait_until(lock, next);
        }
    }
}

// Takes the work of the first subscription after the one served last that has
// any, so that a busy subscription cannot starve the others.
bool SubscriptionHub::TakeDelivery(Clock::time_point now, Delivery& delivery) {
    auto due = [now](const Subscription& s) {
        return !s.pulses.empty() || s.dirty || (s.period && now >= s.nextPoll);
    };
    auto found = std::find_if(subscriptions_.upper_bound(lastServed_), subscriptions_.end(),
                              [&](const auto& entry) { return due(entry.second); });
    if (found == subscriptions_.end()) {
        found = std::find_if(subscriptions_.begin(), subscriptions_.end(),
                             [&](const auto& entry) { return due(entry.second); });
    }
    if (found == subscriptions_.end()) {
        return false;
    }
    Subscription& subscription = found->second;
    const SubscriptionRequest& request = subscription.request;
    delivery.cookie = found->first;
    delivery.sink = request.sink;
    delivery.event = request.event;
    delivery.eventArgs = request.eventArgs;
    delivery.userDef = request.userDef;
    delivery.containData = request.containData;
    delivery.pulses.swap(subscription.pulses);
    delivery.lookAtValue = request.event->style == EventStyle::Value &&
                           (subscription.dirty || (subscription.period && now >= subscription.nextPoll));
    delivery.lastText = subscription.lastText;
    subscription.dirty = false;
    if (subscription.period && now >= subscription.nextPoll) {
        subscription.nextPoll = now + *subscription.period;
    }
    lastServed_ = found->first;
    return true;
}

Clock::time_point SubscriptionHub::NextPoll() const {
    Clock::time_point next = Clock::time_point::max();
    for (const auto& [cookie, subscription] : subscriptions_) {
        if (subscription.period) {
            next = std::min(next, subscription.nextPoll);
        }
    }
    return next;
}

void SubscriptionHub::Deliver(Delivery& delivery) {
    for (const Text& text : delivery.pulses) {
        Send(delivery, text);
    }
    if (delivery.lookAtValue) {
        Text current = controller_->Read(
            [&](const ModelState& state) { return delivery.event->current(state, delivery.eventArgs); });
        if (current != delivery.lastText) {
            Send(delivery, current);
            delivery.newLastText = std::move(current);
        }
    }
}

void SubscriptionHub::Send(Delivery& delivery, TextView text) {
    Variant payload;
    if (delivery.containData != NoData && FAILED(payload.SetString(text))) {
        return;  // no memory for the text: this event is lost, as on a congested link
    }
    TavEventData event{};
    event.userDef = delivery.userDef;
    event.Data = *payload.Get();  // lent for the call; payload frees it
    event.time = FileTimeOf(controller_->Now());
    event.status = S_OK;
    event.eventId = nextEventId_++;
    delivery.sink->OnChange(&event);
}

}  // namespace tav::sim
