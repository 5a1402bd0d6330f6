#include "sim/controller_model.h"

#include "sim/command_table.h"

#include <algorithm>
#include <chrono>

namespace tav::sim {
namespace {

std::int64_t HostSeconds() {
    return std::chrono::duration_cast<std::chrono::seconds>(std::chrono::system_clock::now().time_since_epoch())
        .count();
}

TextView NameOf(TextView url) { return url.empty() ? url : url.substr(1); }

}  // namespace

ControllerModel::ControllerModel(TextView url)
    : url_(url), state_(DefaultState(NameOf(url), static_cast<std::uint32_t>(HostSeconds()))) {
    faults_.OnTransportChange([this](bool up) {
        Update([up](ModelState&, EventPosts& posts) {
            posts.Post(kConnectionEvent, up ? OLESTR("-Connection restored") : OLESTR("-Connection lost"));
        });
    });
}

std::uint32_t ControllerModel::Now(const ModelState& state) {
    const std::int64_t seconds = HostSeconds() + state.clockOffset;
    return static_cast<std::uint32_t>(std::clamp<std::int64_t>(seconds, 0, 0xFFFFFFFFll));
}

std::uint32_t ControllerModel::Now() const {
    return Read([](const ModelState& state) { return Now(state); });
}

void ControllerModel::Reset() {
    faults_.Clear();
    Update([this](ModelState& state, EventPosts&) {
        std::vector<ConnectedClient> clients = std::move(state.clients);
        const std::uint32_t nextClientId = state.nextClientId;
        state = DefaultState(NameOf(url_), static_cast<std::uint32_t>(HostSeconds()));
        state.clients = std::move(clients);
        state.nextClientId = nextClientId;
    });
}

std::uint32_t ControllerModel::ConnectClient(TextView application) {
    return Update([application](ModelState& state, EventPosts&) {
        const std::uint32_t id = state.nextClientId++;
        state.clients.push_back({id, Text(application)});
        return id;
    });
}

void ControllerModel::DisconnectClient(std::uint32_t id) {
    links_.Forget(id);
    Update([id](ModelState& state, EventPosts&) {
        std::erase_if(state.clients, [id](const ConnectedClient& client) { return client.id == id; });
        for (const Subsystem* subsystem : Subsystems()) {
            if (subsystem->clientGone != nullptr) {
                subsystem->clientGone(state, id);
            }
        }
    });
}

void ControllerModel::AddListener(const std::shared_ptr<ModelListener>& listener) {
    std::lock_guard lock(listenersMutex_);
    std::erase_if(listeners_, [](const std::weak_ptr<ModelListener>& known) { return known.expired(); });
    listeners_.push_back(listener);
}

void ControllerModel::RemoveListener(const ModelListener* listener) {
    std::lock_guard lock(listenersMutex_);
    std::erase_if(listeners_, [listener](const std::weak_ptr<ModelListener>& known) {
        const auto alive = known.lock();
        return !alive || alive.get() == listener;
    });
}

void ControllerModel::Publish(const EventPosts& posts) {
    std::vector<std::shared_ptr<ModelListener>> alive;
    {
        std::lock_guard lock(listenersMutex_);
        for (const auto& listener : listeners_) {
            if (auto strong = listener.lock()) {
                alive.push_back(std::move(strong));
            }
        }
    }
    for (const auto& listener : alive) {
        listener->OnModelChanged();
        for (const auto& [name, text] : posts.All()) {
            listener->OnModelEvent(name, text);
        }
    }
}

bool ControllerModel::SetMotorsState(TextView word) {
    if (!IsMotorsStateWord(word)) {
        return false;
    }
    Update([word](ModelState& state, EventPosts&) { state.motors = Text(word); });
    return true;
}

void ControllerModel::SetMode(OperationMode mode) {
    Update([mode](ModelState& state, EventPosts&) {
        state.mode = mode;
        state.pendingConditions.clear();
    });
}

void ControllerModel::SetAutoConditions(std::vector<AutoCondition> conditions) {
    Update([&conditions](ModelState& state, EventPosts&) { state.autoConditions = std::move(conditions); });
}

void ControllerModel::TriggerCollision() {
    Update([](ModelState& state, EventPosts&) {
        state.collision = CollisionState::Triggered;
        if (state.motors == OLESTR("RUN")) {
            state.motors = OLESTR("STAND_BY");
        }
    });
}

void ControllerModel::SetEnergyState(TextView word) {
    Update([word](ModelState& state, EventPosts&) { state.energy = Text(word); });
}

}  // namespace tav::sim
