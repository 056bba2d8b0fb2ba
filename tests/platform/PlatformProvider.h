/**
 * @file
 * The platform provider as an object manager has it: loaded with dlopen, called through its function table.
 */
#pragma once

#include "host/broker/Broker.h"
#include "host/model/Instance.h"

#include <filesystem>
#include <optional>
#include <string>
#include <vector>

#include <gtest/gtest.h>

namespace marlo::test {

/** A schema without classes: the provider has to complete its paths itself. */
class EmptySchema final : public broker::SchemaView {
  public:
    [[nodiscard]] const std::vector<std::string>* keys(std::string_view, std::string_view) const override {
        return nullptr;
    }

    [[nodiscard]] bool isA(std::string_view, std::string_view, std::string_view) const override { return false; }

    [[nodiscard]] const Value* classQualifier(std::string_view, std::string_view, std::string_view) const override {
        return nullptr;
    }

    [[nodiscard]] const Value* propertyQualifier(std::string_view, std::string_view, std::string_view,
                                                 std::string_view) const override {
        return nullptr;
    }

    [[nodiscard]] const Value* methodQualifier(std::string_view, std::string_view, std::string_view,
                                               std::string_view) const override {
        return nullptr;
    }

    [[nodiscard]] const Value* parameterQualifier(std::string_view, std::string_view, std::string_view,
                                                  std::string_view, std::string_view) const override {
        return nullptr;
    }
};

/** What a call brought. */
struct Answer {
    CMPIrc code = CMPI_RC_OK;
    std::string message;
    bool done = false; ///< the provider ended its answer
    std::vector<Instance> instances;
    std::vector<ObjectPath> paths;
};

/** A property list as a client gives it; none means all. */
using Properties = std::optional<std::vector<const char*>>;

/** One of the two providers. Operations may be called from any thread. */
class PlatformProvider {
  public:
    /** Loads the library and calls the factory. `handle` stands in for the broker's own. */
    explicit PlatformProvider(std::string className, const CMPIBroker* handle = nullptr);

    [[nodiscard]] Answer names() const;
    [[nodiscard]] Answer instances(const Properties& properties = std::nullopt) const;
    [[nodiscard]] Answer get(const ObjectPath& path, const Properties& properties = std::nullopt) const;

    [[nodiscard]] CMPIInstanceMI* mi() const { return _mi; }

    [[nodiscard]] const broker::Broker& broker() const { return _broker; }

    /** A broker without up-calls over a schema without classes. */
    static const broker::Broker& sharedBroker();

  private:
    template <class Operation>
    Answer call(const ObjectPath& path, const Operation& operation) const;

    std::string _className;
    const broker::Broker& _broker = sharedBroker();
    CMPIInstanceMI* _mi;
};

/** The instance of a key value, or null. */
const Instance* findInstance(const Answer& answer, const std::string& key, const std::string& value);

/** The text of a property; none when it is NULL, missing or no text. */
std::optional<std::string> textOf(const Instance& instance, const std::string& name);

/** A described host that stands in for this one as long as the object lives; one at a time. */
class DescribedHost {
  public:
    explicit DescribedHost(const std::string& toml);
    ~DescribedHost();
    DescribedHost(const DescribedHost&) = delete;
    DescribedHost& operator=(const DescribedHost&) = delete;

    [[nodiscard]] const std::string& file() const { return _file; }

  private:
    std::string _file;
};

} // namespace marlo::test
