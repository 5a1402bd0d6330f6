#include "sim/controller_registry.h"

#include <map>
#include <mutex>

namespace tav::sim {

TextView ControllerUrlOf(TextView url) {
    if (url.size() < 2 || url.front() != OLECHAR('/') || url[1] == OLECHAR('/')) {
        return TextView();
    }
    return url.substr(0, url.find(OLECHAR('/'), 1));
}

std::shared_ptr<ControllerModel> ControllerAt(TextView url) {
    const TextView key = ControllerUrlOf(url);
    if (key.empty()) {
        return nullptr;
    }
    static std::mutex mutex;
    static std::map<Text, std::shared_ptr<ControllerModel>, std::less<>> controllers;
    std::lock_guard lock(mutex);
    auto found = controllers.find(key);
    if (found == controllers.end()) {
        found = controllers.emplace(Text(key), std::make_shared<ControllerModel>(key)).first;
    }
    return found->second;
}

}  // namespace tav::sim
