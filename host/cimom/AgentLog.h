/**
 * @file
 * What the agent library logs while an operation runs.
 */
#pragma once

#include <string>
#include <vector>

namespace marlo {

/**
 * Collects the failures that the agent logs on this thread during its life. Within another collector of the thread it
 * collects nothing: an operation that a provider asks for belongs to the one that asked the provider.
 */
class AgentLogCollector {
  public:
    AgentLogCollector();
    ~AgentLogCollector();
    AgentLogCollector(const AgentLogCollector&) = delete;
    AgentLogCollector& operator=(const AgentLogCollector&) = delete;

    /** What has been logged so far, in order, repetitions left out; empties the collection. */
    std::vector<std::string> take();

    /**
     * Asks the agent library for its log when it is in the process by now: it comes with the first provider that
     * needs it. An agent that cannot be asked is left alone.
     */
    static void connect();

  private:
    void add(const char* message);
    static void observe(int level, const char* logger, const char* message, void* context);

    std::vector<std::string> _messages;
    bool _outermost;
};

} // namespace marlo
