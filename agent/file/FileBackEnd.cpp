#include "agent/file/FileBackEnd.h"

#include "agent/change/Resolve.h"
#include "agent/file/DescriptionChange.h"
#include "agent/file/FileCache.h"
#include "agent/file/FileWatch.h"
#include "agent/file/TreeFile.h"
#include "agent/persistence/FileTransaction.h"

#include <algorithm>
#include <map>
#include <mutex>
#include <stdexcept>
#include <utility>
#include <vector>

namespace Orv::Agent {

namespace {

/** An adapter of a tree, and which one of the description's it is. */
struct AdapterPlace {
    Tree::NodePointer node; ///< null: there is none
    std::size_t number = 0;
};

AdapterPlace placeOf(const Tree& tree, const std::string& path) {
    const auto& adapters = tree.nodesOfType(NodeLexicon::NODE_NETWORK_ADAPTER);
    const auto found = std::find_if(adapters.begin(), adapters.end(),
                                    [&](const Tree::NodePointer& node) { return node->path == path; });
    return {found == adapters.end() ? nullptr : *found, static_cast<std::size_t>(found - adapters.begin())};
}

class FileBackEnd : public BackEnd {
  public:
    FileBackEnd(const std::string& path, std::string control)
        : _path(path), _control(std::move(control)), _file(path, parseTree) {}

    std::shared_ptr<const Tree> snapshot() override {
        const std::lock_guard lock(_mutex);
        return _file.current();
    }

    void setProperty(const std::string& path, NodeLexicon::Properties property, const PropertyValue& value) override {
        const std::lock_guard lock(_mutex);
        const TextFile file = readTextFile(_path);
        const AdapterPlace adapter = placeOf(*_file.madeOf(file), path);
        if (adapter.node == nullptr) {
            throw ChangeError(path, property, value, "there is no such adapter in " + _path);
        }
        const std::string name = nameOf(*adapter.node);
        const Resolution resolution =
            resolve(name, property, value, settingsOf(adapter.node->properties), _pending[path]);
        try {
            write(file.text, adapter, resolution.wanted);
        } catch (const std::exception& failure) {
            throw ChangeError(name, property, value, failure.what());
        }
        _pending[path] = resolution.pending;
    }

    std::unique_ptr<EventWatch> watch(EventSink& sink) override {
        return makeFileWatch(*this, _path, _control, sink);
    }

  private:
    /** Makes the change in the file; does not touch a file that says so already. */
    void write(const std::string& text, const AdapterPlace& adapter, const AdapterSettings& wanted) {
        const std::vector<KeyEdit> edits = keyEdits(adapter.node->properties, wanted);
        if (edits.empty()) {
            return;
        }
        const std::string changed = editAdapter(text, _path, adapter.number, edits);
        // What cannot be read back as it was meant is better not written.
        const AdapterPlace result = placeOf(*parseTree(changed, _path), adapter.node->path);
        if (result.node == nullptr || !keyEdits(result.node->properties, wanted).empty()) {
            throw std::runtime_error(_path + ": cannot be edited in the form that it has");
        }
        Persistence::FileTransaction transaction;
        transaction.apply({{_path, text, changed}});
        transaction.commit();
    }

    /** How people know the node: by its identity, else by its path. */
    static std::string nameOf(const Node& node) {
        const auto identity = node.properties.find(NodeLexicon::PROP_NODE_STRING);
        const auto* text = identity == node.properties.end() ? nullptr : std::get_if<std::string>(&identity->second);
        return text == nullptr ? node.path : *text;
    }

    const std::string _path;
    const std::string _control;
    std::mutex _mutex; ///< guards what follows
    FileCache<Tree> _file;
    std::map<std::string, PendingPair> _pending; ///< by path
};

} // namespace

std::unique_ptr<BackEnd> makeFileBackEnd(const std::string& path, std::string control) {
    return std::make_unique<FileBackEnd>(path, std::move(control));
}

} // namespace Orv::Agent
