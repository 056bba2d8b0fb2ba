#include "agent/file/FileBackEnd.h"

#include "agent/config/TextFile.h"
#include "agent/file/TreeFile.h"

#include <functional>
#include <mutex>
#include <stdexcept>
#include <utility>

namespace Orv::Agent {

namespace {

std::string textOf(const PropertyValue& value) {
    if (const auto* number = std::get_if<unsigned int>(&value)) {
        return std::to_string(*number);
    }
    if (const auto* text = std::get_if<std::string>(&value)) {
        return '"' + *text + '"';
    }
    std::string list;
    for (const std::string& element : std::get<std::vector<std::string>>(value)) {
        list += (list.empty() ? "\"" : ", \"") + element + '"';
    }
    return '[' + list + ']';
}

/** What the last reading gave. */
struct Reading {
    std::shared_ptr<const Tree> tree;
    FileStamp stamp;
    bool settled = false;
    std::size_t textHash = 0;
};

class FileBackEnd : public BackEnd {
  public:
    explicit FileBackEnd(std::string path) : _path(std::move(path)) {}

    std::shared_ptr<const Tree> snapshot() override {
        const std::lock_guard lock(_mutex);
        if (!isCurrent()) {
            refresh();
        }
        return _last.tree;
    }

    void setProperty(const std::string& path, NodeLexicon::Properties property, const PropertyValue& value) override {
        throw std::runtime_error(nameOf(path) + ": property " + std::to_string(property) + " cannot be set to " +
                                 textOf(value) + ": the tree file " + _path + " is only read");
    }

  private:
    /** Throws when there is no file. */
    bool isCurrent() { return stampOf(_path) == _last.stamp && _last.settled && _last.tree != nullptr; }

    void refresh() {
        TextFile file = readTextFile(_path);
        const std::size_t hash = std::hash<std::string>()(file.text);
        const bool same = _last.tree != nullptr && file.stamp == _last.stamp && hash == _last.textHash;
        std::shared_ptr<const Tree> tree = same ? _last.tree : nullptr;
        _last = {}; // its memory serves for the next one, if no cursor holds the tree
        if (tree == nullptr) {
            tree = parseTree(file.text, _path);
        }
        _last = {std::move(tree), file.stamp, file.settled, hash};
    }

    /** How people know the node: by its identity, else by its path. */
    std::string nameOf(const std::string& path) {
        const auto node = snapshot()->find(path);
        if (node == nullptr) {
            return path;
        }
        const auto identity = node->properties.find(NodeLexicon::PROP_NODE_STRING);
        const auto* text = identity == node->properties.end() ? nullptr : std::get_if<std::string>(&identity->second);
        return text == nullptr ? path : *text;
    }

    const std::string _path;
    std::mutex _mutex;
    Reading _last;
};

} // namespace

std::unique_ptr<BackEnd> makeFileBackEnd(std::string path) {
    return std::make_unique<FileBackEnd>(std::move(path));
}

} // namespace Orv::Agent
