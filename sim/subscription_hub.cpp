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

// BinaryData carries the text as bytes, one per character (Latin-1, as the
// controller's texts are), in a byte-length BSTR: SysStringByteLen is the
// text's length and no terminating wide character is implied.
HRESULT BinaryPayload(TextView text, Variant& payload) {
    std::string bytes(text.size(), '\0');
    std::transform(text.begin(), text.end(), bytes.begin(),
                   [](OLECHAR c) { return static_cast<char>(c <= 0xFF ? c : '?'); });
    BSTR data = SysAllocStringByteLen(bytes.data(), static_cast<UINT>(bytes.size()));
    if (data == nullptr) {
        return E_OUTOFMEMORY;
    }
    Bstr owned;
    owned.Attach(data);
    payload.SetBstr(std::move(owned));
    return S_OK;
}

}  // namespace

struct SubscriptionHub::Subscription {
    SubscriptionRequest request;
    Text lastQueued;  // value events: the text queued last
    std::deque<Text> queued;
    std::optional<Clock::duration> period;
    Clock::time_point nextPoll;
};

struct SubscriptionHub::Delivery {
    ULONG cookie = 0;
    ComPtr<_ITavObjectEvents> sink;
    ULONG userDef = 0;
    TavContainData containData = Data;
    std::deque<Text> texts;
};

SubscriptionHub::SubscriptionHub(std::shared_ptr<ControllerModel> controller) : controller_(std::move(controller)) {}

SubscriptionHub::~SubscriptionHub() { Stop(); }

ULONG SubscriptionHub::Add(SubscriptionRequest request) {
    Subscription subscription;
    if (auto greeting = GreetingOf(*request.event, *controller_)) {
        subscription.queued.push_back(std::move(*greeting));
    }
    // A forced poll time (and 0) means on change only: never looked at on
    // a timer, only right after each change.
    if (request.pollTime != 0 && request.pollTime < kNeverPolled) {
        subscription.period = std::max(kShortestPoll, std::chrono::milliseconds(request.pollTime));
        subscription.nextPoll = Clock::now() + *subscription.period;
    }
    subscription.request = std::move(request);

    ULONG cookie = 0;
    {
        // The hub listens, and a value is taken as the one last told, under
        // the hub's lock: a change made meanwhile is either in that value or
        // told to the hub after it, never lost in between.
        std::lock_guard lock(mutex_);
        if (stopping_) {
            return 0;
        }
        if (!listening_) {
            listening_ = true;
            controller_->AddListener(shared_from_this());
        }
        const SubscriptionRequest& added = subscription.request;
        if (added.event->style == EventStyle::Value) {
            subscription.lastQueued = controller_->Read(
                [&](const ModelState& state) { return added.event->current(state, added.eventArgs); });
        }
        cookie = nextCookie_++;
        if (nextCookie_ == 0) {
            nextCookie_ = 1;
        }
        subscriptions_.emplace(cookie, std::move(subscription));
        if (!thread_.joinable()) {
            thread_ = std::thread([self = shared_from_this()] { self->Run(); });
        }
    }
    wake_.notify_all();
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
        QueueChangedValues(false, Clock::now());
    }
    wake_.notify_all();
}

// The controller's lock is taken inside the hub's; never the other way round
// (the controller calls its listeners only after leaving its lock).
void SubscriptionHub::QueueChangedValues(bool dueOnly, Clock::time_point now) {
    std::vector<Subscription*> looked;
    for (auto& [cookie, subscription] : subscriptions_) {
        if (subscription.request.event->style != EventStyle::Value) {
            continue;
        }
        if (dueOnly) {
            if (!subscription.period || now < subscription.nextPoll) {
                continue;
            }
            subscription.nextPoll = now + *subscription.period;
        }
        looked.push_back(&subscription);
    }
    if (looked.empty()) {
        return;
    }
    controller_->Read([&](const ModelState& state) {
        for (Subscription* subscription : looked) {
            const SubscriptionRequest& request = subscription->request;
            Text current = request.event->current(state, request.eventArgs);
            if (current != subscription->lastQueued) {
                subscription->queued.push_back(current);
                subscription->lastQueued = std::move(current);
            }
        }
    });
}

void SubscriptionHub::OnModelEvent(TextView eventName, TextView text) {
    {
        std::lock_guard lock(mutex_);
        for (auto& [cookie, subscription] : subscriptions_) {
            const EventRow& event = *subscription.request.event;
            if (event.style == EventStyle::Pulse && event.name == eventName) {
                subscription.queued.emplace_back(text);
            }
        }
    }
    wake_.notify_all();
}

void SubscriptionHub::Run() {
    std::unique_lock lock(mutex_);
    while (!stopping_) {
        QueueChangedValues(true, Clock::now());
        Delivery delivery;
        if (TakeDelivery(delivery)) {
            delivering_ = delivery.cookie;
            lock.unlock();
            for (std::size_t i = 0; i < delivery.texts.size(); ++i) {
                if (i > 0) {
                    // The sink may have unsubscribed in its OnChange.
                    std::lock_guard check(mutex_);
                    if (stopping_ || !subscriptions_.contains(delivery.cookie)) {
                        break;
                    }
                }
                Send(delivery, delivery.texts[i]);
            }
            delivery.sink = nullptr;
            lock.lock();
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

// Takes the queued events of the first subscription after the one served
// last that has any, so that a busy subscription cannot starve the others.
bool SubscriptionHub::TakeDelivery(Delivery& delivery) {
    auto waiting = [](const auto& entry) { return !entry.second.queued.empty(); };
    auto found = std::find_if(subscriptions_.upper_bound(lastServed_), subscriptions_.end(), waiting);
    if (found == subscriptions_.end()) {
        found = std::find_if(subscriptions_.begin(), subscriptions_.end(), waiting);
    }
    if (found == subscriptions_.end()) {
        return false;
    }
    const SubscriptionRequest& request = found->second.request;
    delivery.cookie = found->first;
    delivery.sink = request.sink;
    delivery.userDef = request.userDef;
    delivery.containData = request.containData;
    delivery.texts.swap(found->second.queued);
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

void SubscriptionHub::Send(Delivery& delivery, TextView text) {
    Variant payload;
    HRESULT filled = S_OK;
    if (delivery.containData == BinaryData) {
        filled = BinaryPayload(text, payload);
    } else if (delivery.containData != NoData) {
        filled = payload.SetString(text);
    }
    if (FAILED(filled)) {
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
