/**
 * @file
 * Classes for tests that need no library: things in memory that can be made, changed, asked, linked and removed.
 */
#pragma once

#include "host/cimom/BuiltIn.h"

#include <functional>
#include <memory>
#include <mutex>

namespace marlo::test {

/** The classes of Items, in root/test; needs the qualifiers of the shipped schema. */
extern const char* const itemsMof;

/**
 * TEST_Item and TEST_SubItem, two of the one and one of the other to begin with, and TEST_Link from the first item to
 * each of the others. TEST_Item.Echo gives back what it was given, Explode throws, Hello is static and names who
 * asks. TEST_Stream has as many instances as `streamLength` says, and calls `onStream` before each; at the one that
 * `streamFailsAt` names it fails.
 */
class Items final : public BuiltIn {
  public:
    Items();

    [[nodiscard]] std::string nameSpace() const override { return "root/test"; }

    [[nodiscard]] std::vector<std::string> classes() const override;

    Status enumerate(const Class& definition, const ObjectManager::InstanceSink& sink) override;
    Status create(const Class& definition, const Instance& instance, ObjectPath& created) override;
    Status modify(const Class& definition, const Instance& instance, const std::vector<std::string>& names) override;
    Status remove(const Class& definition, const ObjectPath& path) override;
    Status invoke(const Class& definition, const ObjectPath& path, const Method& method,
                  const std::vector<NamedValue>& arguments, MethodAnswer& answer) override;

    std::size_t streamLength = 3;
    std::size_t streamFailsAt = 0; ///< counted from 1; 0: never
    std::function<void(std::size_t index)> onStream;

  private:
    Status stream(const ObjectManager::InstanceSink& sink) const;

    std::mutex _mutex;
    std::vector<Instance> _items;
};

} // namespace marlo::test
