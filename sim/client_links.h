#pragma once
#include <cstdint>
#include <map>
#include <shared_mutex>

#include "TavController.h"
#include "tav/com_ptr.h"

namespace tav::sim {

// How the controller reaches each connected client on its own initiative:
// the sink its messages go to. Read on every message, written when a client
// connects its sink or goes away.
class ClientLinks {
public:
    void SetMessageSink(std::uint32_t clientId, ComPtr<_ITavIPCMessages> sink) {
        std::unique_lock lock(mutex_);
        if (sink) {
            sinks_[clientId] = std::move(sink);
        } else {
            sinks_.erase(clientId);
        }
    }

    // Empty when the client has connected none.
    ComPtr<_ITavIPCMessages> MessageSinkOf(std::uint32_t clientId) const {
        std::shared_lock lock(mutex_);
        const auto found = sinks_.find(clientId);
        return found == sinks_.end() ? ComPtr<_ITavIPCMessages>() : found->second;
    }

    void Forget(std::uint32_t clientId) { SetMessageSink(clientId, {}); }

private:
    mutable std::shared_mutex mutex_;
    std::map<std::uint32_t, ComPtr<_ITavIPCMessages>> sinks_;
};

}  // namespace tav::sim
