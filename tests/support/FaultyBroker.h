/**
 * @file
 * The object manager's own broker with every slot that a provider may call recorded, and failing where a test says
 * so.
 */
#pragma once

#include "host/broker/Broker.h"

#include <functional>
#include <map>
#include <mutex>
#include <string>
#include <vector>

#include <cmpift.h>

namespace marlo::test {

/** How a slot fails. */
enum class Failure {
    withStatus, ///< returns nothing, CMPI_RC_ERR_FAILED in its status
    silently,   ///< returns nothing and leaves its status alone
    throwing,   ///< throws an int, as a broker in another language might
};

/**
 * A handle of its own on a broker. Slots are named after the function tables: "newInstance", "enumerateInstances",
 * "newThread" and so on for the broker's, "instance.setProperty", "objectPath.getKeyCount", "array.setElementAt",
 * "args.getArg",
 * "string.getCharPtr", "enumeration.getNext", "result.returnInstance" for those of encapsulated objects, which pass
 * through this broker by being created by it or by adopt(). The real slot does the work of every call that does not
 * fail.
 *
 * One at a time in a process; calls may come from any thread, but set it up while there are none.
 */
class FaultyBroker {
  public:
    explicit FaultyBroker(const broker::Broker& real);
    ~FaultyBroker();
    FaultyBroker(const FaultyBroker&) = delete;
    FaultyBroker& operator=(const FaultyBroker&) = delete;

    [[nodiscard]] const CMPIBroker* handle() const { return &_handle; }

    /** As handle(), to be changed further. */
    CMPIBroker& changeable() { return _handle; }

    /** Has the calls on an object that the test made go through this broker too. */
    CMPIObjectPath* adopt(CMPIObjectPath* path);
    CMPIInstance* adopt(CMPIInstance* instance);
    CMPIArray* adopt(CMPIArray* array);
    CMPIArgs* adopt(CMPIArgs* arguments);
    CMPIString* adopt(CMPIString* string);
    CMPIEnumeration* adopt(CMPIEnumeration* enumeration);
    const CMPIResult* adopt(const CMPIResult* result);

    /** Has the `nth` (from 1) call of a slot fail; 0 for every call. Replaces an earlier order. */
    void failAt(std::string slot, int nth, Failure failure);
    void failNothing();

    /** Shown every call before it is done: its slot and its texts and counts, such as "newArray 2". May throw. */
    std::function<void(const std::string& call)> before;

    /** May change the data that a slot returns. */
    std::function<void(const std::string& slot, CMPIData& data)> alter;

    /** Every call so far, as `before` is shown it. */
    [[nodiscard]] std::vector<std::string> calls() const;
    /** How often each slot was called so far. */
    [[nodiscard]] std::map<std::string, int> counts() const;
    void forgetCalls();

    /** For the slots themselves: counts the call; true, or an exception, when it is the one to fail. */
    bool fails(const char* slot, const std::string& call, Failure& failure);

    /** The broker in force. */
    static FaultyBroker& current();

  private:
    CMPIBroker _handle;
    CMPIBrokerFT _broker;
    CMPIBrokerEncFT _factory;
    CMPIBrokerExtFT _threads;
    mutable std::mutex _mutex; ///< guards what follows
    std::vector<std::string> _calls;
    std::map<std::string, int> _counts;
    std::string _failing;
    int _nth = 0;
    Failure _failure = Failure::withStatus;
};

} // namespace marlo::test
