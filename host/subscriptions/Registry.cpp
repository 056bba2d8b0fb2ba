#include "host/subscriptions/Registry.h"

#include <algorithm>

namespace marlo::subscriptions {

void Registry::put(const ObjectPointer& object) {
    const std::lock_guard lock(_mutex);
    _objects[object->id] = object;
    _byPath[object->path()] = object->id;
}

void Registry::remove(Id id) {
    const std::lock_guard lock(_mutex);
    const auto found = _objects.find(id);
    if (found != _objects.end()) {
        _byPath.erase(found->second->path());
        _objects.erase(found);
    }
}

ObjectPointer Registry::find(Id id) const {
    const std::lock_guard lock(_mutex);
    const auto found = _objects.find(id);
    return found == _objects.end() ? nullptr : found->second;
}

ObjectPointer Registry::find(const std::string& path) const {
    const std::lock_guard lock(_mutex);
    const auto found = _byPath.find(path);
    return found == _byPath.end() ? nullptr : _objects.at(found->second);
}

std::vector<ObjectPointer> Registry::all(Kind kind) const {
    std::vector<ObjectPointer> found;
    const std::lock_guard lock(_mutex);
    for (const auto& [id, object] : _objects) {
        if (object->kind == kind) {
            found.push_back(object);
        }
    }
    return found;
}

std::vector<ObjectPointer> Registry::referringTo(const std::string& path) const {
    std::vector<ObjectPointer> found = all(Kind::subscription);
    found.erase(std::remove_if(found.begin(), found.end(),
                               [&path](const ObjectPointer& each) {
                                   return targetOf(*each, "Filter") != path && targetOf(*each, "Handler") != path;
                               }),
                found.end());
    return found;
}

std::size_t Registry::count(Kind kind) const {
    const std::lock_guard lock(_mutex);
    return static_cast<std::size_t>(std::count_if(_objects.begin(), _objects.end(),
                                                  [kind](const auto& each) { return each.second->kind == kind; }));
}

} // namespace marlo::subscriptions
