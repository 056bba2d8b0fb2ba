/**
 * @file
 * Where an MI function puts its answer, as seen from the object manager.
 */
#pragma once

#include <memory>
#include <string>

#include <cmpift.h>

namespace marlo::broker {

/** Receives what a provider returns, on the thread on which it returns it. May throw. */
class ResultSink {
  public:
    virtual ~ResultSink() = default;
    ResultSink(const ResultSink&) = delete;
    ResultSink& operator=(const ResultSink&) = delete;

    /** The handles are good and remain the provider's. */
    virtual void instance(const CMPIInstance& instance) = 0;
    virtual void path(const CMPIObjectPath& path) = 0;
    virtual void data(const CMPIData& data) = 0;
    /** The provider gave a CIM_Error instead of an answer. */
    virtual void error(CMPIrc code, const std::string& message) = 0;

  protected:
    ResultSink() = default;
};

/** The CMPIResult of one call. The handle is good as long as the object; what comes after returnDone is refused. */
class Result {
  public:
    explicit Result(ResultSink& sink);
    ~Result();
    Result(const Result&) = delete;
    Result& operator=(const Result&) = delete;

    [[nodiscard]] const CMPIResult* handle() const;

    /** True once the provider has called returnDone. */
    [[nodiscard]] bool isDone() const;

    /** Throws what the sink threw: it was kept back, so as not to pass through the provider. */
    void rethrow() const;

  private:
    class Object;
    std::unique_ptr<Object> _object;
};

} // namespace marlo::broker
