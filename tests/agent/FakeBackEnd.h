/**
 * @file
 * A back end whose trees a test sets, counting what is asked of it.
 */
#pragma once

#include "agent/tree/BackEnd.h"

#include <memory>
#include <stdexcept>
#include <string>
#include <vector>

namespace Orv::Test {

class FakeBackEnd : public Agent::BackEnd {
  public:
    std::shared_ptr<const Agent::Tree> snapshot() override {
        ++snapshots;
        if (!failure.empty()) {
            throw std::runtime_error(failure);
        }
        return tree;
    }

    void setProperty(const std::string& path, NodeLexicon::Properties property,
                     const Agent::PropertyValue& value) override {
        writes.push_back({path, property, value});
    }

    struct Write {
        std::string path;
        NodeLexicon::Properties property;
        Agent::PropertyValue value;

        bool operator==(const Write&) const = default;
    };

    std::shared_ptr<const Agent::Tree> tree = std::make_shared<const Agent::Tree>();
    int snapshots = 0;
    std::string failure;
    std::vector<Write> writes;
};

inline Agent::Tree::NodePointer makeNode(std::string path, std::string parent,
                                         std::optional<NodeLexicon::NodeType> type, std::string description = "",
                                         Agent::PropertyMap properties = {}) {
    return std::make_shared<const Agent::Node>(
        Agent::Node{std::move(path), std::move(parent), type, std::move(description), std::move(properties)});
}

} // namespace Orv::Test
