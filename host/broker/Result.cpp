#include "host/broker/Result.h"

#include "host/broker/Slot.h"
#include "host/broker/Values.h"

#include <exception>
#include <utility>

namespace marlo::broker {

class Result::Object final : public broker::Object<CMPIResult, Kind::result> {
  public:
    explicit Object(ResultSink& target) : broker::Object<CMPIResult, Kind::result>(nullptr, table), sink(target) {}

    ResultSink& sink;
    bool done = false;
    std::exception_ptr failure;

    /** Hands something to the sink. After a failure of the sink nothing more is handed to it. */
    template <typename Handing>
    CMPIrc hand(const Handing& handing) {
        if (done || failure) {
            return CMPI_RC_ERR_FAILED;
        }
        try {
            handing();
            return CMPI_RC_OK;
        } catch (...) {
            failure = std::current_exception();
            return CMPI_RC_ERR_FAILED;
        }
    }

    static CMPIrc returnData(Object& result, const CMPIValue* value, CMPIType type) {
        CMPIData taken;
        const CMPIrc code = takeValue(currentArena(), value, type, Accepted::cim, taken);
        return code == CMPI_RC_OK ? result.hand([&] { result.sink.data(taken); }) : code;
    }

    static CMPIrc returnInstance(Object& result, const CMPIInstance* instance) {
        return objectOf<InstanceObject>(instance) == nullptr ? CMPI_RC_ERR_INVALID_HANDLE
                                                             : result.hand([&] { result.sink.instance(*instance); });
    }

    static CMPIrc returnObjectPath(Object& result, const CMPIObjectPath* path) {
        return objectOf<ObjectPathObject>(path) == nullptr ? CMPI_RC_ERR_INVALID_HANDLE
                                                           : result.hand([&] { result.sink.path(*path); });
    }

    static CMPIrc returnDone(Object& result) {
        return result.hand([&] { result.done = true; });
    }

    static CMPIrc returnError(Object& result, const CMPIError* handle) {
        const auto* error = objectOf<ErrorObject>(handle);
        if (error == nullptr) {
            return CMPI_RC_ERR_INVALID_HANDLE;
        }
        const std::string message(error->message == nullptr ? "" : error->message->text());
        return result.hand([&] { result.sink.error(error->code, message); });
    }

    static CMPIrc release(Object& /*result*/) { return CMPI_RC_OK; }

    /** A result is bound to its call, which a clone would outlive. */
    static CMPIResult* clone(CMPIStatus& status, Object& /*result*/) {
        status.rc = CMPI_RC_ERR_NOT_SUPPORTED;
        return nullptr;
    }

    static CMPIStatus releaseResult(CMPIResult* handle) { return Slot<release>::call(handle); }

    static const CMPIResultFT table;
};

const CMPIResultFT Result::Object::table = {
    CMPI_VERSION,         releaseResult,          slot<clone>,      slot<returnData>,
    slot<returnInstance>, slot<returnObjectPath>, slot<returnDone>, slot<returnError>,
};

Result::Result(ResultSink& sink) : _object(std::make_unique<Object>(sink)) {}

Result::~Result() = default;

const CMPIResult* Result::handle() const {
    return &_object->handle;
}

bool Result::isDone() const {
    return _object->done;
}

void Result::rethrow() const {
    if (_object->failure) {
        std::rethrow_exception(_object->failure);
    }
}

} // namespace marlo::broker
