/**
 * @file
 * Providers of which each does one thing that no provider should.
 */
#include <atomic>
#include <stdexcept>
#include <string>

#include <cmpimacs.h>

namespace {

const CMPIBroker* broker;

struct Call {
    const CMPIContext* context;
    const CMPIResult* result;
    const CMPIObjectPath* reference;
};

CMPIStatus answer(CMPIrc code) {
    return {code, nullptr};
}

CMPIInstance* odd(const Call& call, const char* className = "Test_Odd", const char* id = "x") {
    const char* nameSpace = CMGetCharPtr(CMGetNameSpace(call.reference, nullptr));
    CMPIInstance* instance = CMNewInstance(broker, CMNewObjectPath(broker, nameSpace, className, nullptr), nullptr);
    if (id != nullptr) {
        CMSetProperty(instance, "Id", id, CMPI_chars);
    }
    return instance;
}

CMPIStatus giveBack(const Call& call, const CMPIInstance* instance) {
    CMReturnInstance(call.result, instance);
    CMReturnDone(call.result);
    return answer(CMPI_RC_OK);
}

CMPIStatus throwsException(const Call&) {
    throw std::runtime_error("the text of the exception");
}

CMPIStatus throwsInt(const Call&) {
    throw 7;
}

CMPIStatus wrongTypes(const Call& call) {
    CMPIInstance* instance = odd(call);
    const CMPIUint32 number = 1;
    CMPIArray* array = CMNewArray(broker, 1, CMPI_string, nullptr);
    CMSetProperty(instance, "Count", &number, CMPI_uint32);
    CMSetProperty(instance, "Counts", &array, CMPI_stringA);
    CMSetProperty(instance, "Note", nullptr, CMPI_null);
    return giveBack(call, instance);
}

CMPIStatus unknownProperty(const Call& call) {
    CMPIInstance* instance = odd(call);
    CMSetProperty(instance, "Unheard", "x", CMPI_chars);
    CMSetProperty(instance, "Note", "kept", CMPI_chars);
    return giveBack(call, instance);
}

CMPIStatus nullInstance(const Call& call) {
    CMReturnInstance(call.result, nullptr);
    return giveBack(call, odd(call));
}

CMPIStatus otherClass(const Call& call) {
    CMReturnInstance(call.result, odd(call, "Test_Thing"));
    CMReturnInstance(call.result, odd(call, "Unheard"));
    return giveBack(call, odd(call, "test_odd"));
}

CMPIStatus missingKey(const Call& call) {
    CMReturnInstance(call.result, odd(call, "Test_Odd", nullptr));
    return giveBack(call, odd(call));
}

CMPIStatus recursing(const Call& call) {
    CMPIStatus status{};
    CBEnumInstances(broker, call.context, call.reference, nullptr, &status);
    return status;
}

CMPIStatus noReason(const Call&) {
    return answer(CMPI_RC_ERR_ACCESS_DENIED);
}

CMPIStatus reason(const Call&) {
    CMPIStatus status{};
    CMSetStatusWithChars(broker, &status, CMPI_RC_ERR_ACCESS_DENIED, "the provider's own reason");
    return status;
}

CMPIStatus foreignCode(const Call&) {
    return answer(CMPI_RC_ERR_INVALID_HANDLE);
}

CMPIStatus cimError(const Call& call) {
    CMPIError* error = broker->eft->newCMPIError(broker, "o", "i", "an error object", ErrorSeverityLow,
                                                 ErrorProbCauseOther, CMPI_RC_ERR_ACCESS_DENIED, nullptr);
    call.result->ft->returnError(call.result, error);
    return answer(CMPI_RC_OK);
}

CMPIStatus twoAnswers(const Call& call) {
    CMReturnInstance(call.result, odd(call));
    return giveBack(call, odd(call));
}

CMPIStatus silent(const Call&) {
    return answer(CMPI_RC_OK);
}

using Function = CMPIStatus (*)(const Call&);

CMPIStatus cleanup(CMPIInstanceMI*, const CMPIContext*, CMPIBoolean) {
    throw std::runtime_error("cleanup");
}

template <Function function>
CMPIStatus names(CMPIInstanceMI*, const CMPIContext* context, const CMPIResult* result,
                 const CMPIObjectPath* reference) {
    return function({context, result, reference});
}

template <Function function>
CMPIStatus instances(CMPIInstanceMI*, const CMPIContext* context, const CMPIResult* result,
                     const CMPIObjectPath* reference, const char**) {
    return function({context, result, reference});
}

/** The writing slots: nobody calls them here. */
template <typename... Arguments>
CMPIStatus refuse(Arguments...) {
    return answer(CMPI_RC_ERR_NOT_SUPPORTED);
}

template <Function function>
CMPIInstanceMI* interfaceOf(const CMPIBroker* mb) {
    static const CMPIInstanceMIFT table = {
        CMPI_VERSION,        CMPI_VERSION, "instanceOdd", cleanup, names<function>, instances<function>,
        instances<function>, refuse,       refuse,        refuse,  refuse};
    static CMPIInstanceMI interface = {nullptr, &table};
    broker = mb;
    return &interface;
}

std::atomic<bool> factoryWorks{false};

} // namespace

#define ODD_PROVIDER(name, function)                                                                                 \
    CMPI_EXTERN_C CMPIInstanceMI* name##_Create_InstanceMI(const CMPIBroker* mb, const CMPIContext*, CMPIStatus*) {  \
        return interfaceOf<function>(mb);                                                                            \
    }

ODD_PROVIDER(ThrowsException, throwsException)
ODD_PROVIDER(ThrowsInt, throwsInt)
ODD_PROVIDER(WrongTypes, wrongTypes)
ODD_PROVIDER(UnknownProperty, unknownProperty)
ODD_PROVIDER(NullInstance, nullInstance)
ODD_PROVIDER(OtherClass, otherClass)
ODD_PROVIDER(MissingKey, missingKey)
ODD_PROVIDER(Recursing, recursing)
ODD_PROVIDER(NoReason, noReason)
ODD_PROVIDER(Reason, reason)
ODD_PROVIDER(ForeignCode, foreignCode)
ODD_PROVIDER(CimError, cimError)
ODD_PROVIDER(TwoAnswers, twoAnswers)
ODD_PROVIDER(Silent, silent)

CMPI_EXTERN_C CMPIInstanceMI* NullFactory_Create_InstanceMI(const CMPIBroker* mb, const CMPIContext*,
                                                            CMPIStatus* status) {
    CMSetStatusWithChars(mb, status, CMPI_RC_ERR_FAILED, "not today");
    return nullptr;
}

CMPI_EXTERN_C CMPIInstanceMI* ThrowingFactory_Create_InstanceMI(const CMPIBroker*, const CMPIContext*, CMPIStatus*) {
    throw std::runtime_error("the factory's text");
}

/** Makes nothing the first time. */
CMPI_EXTERN_C CMPIInstanceMI* SecondTry_Create_InstanceMI(const CMPIBroker* mb, const CMPIContext*, CMPIStatus*) {
    return factoryWorks.exchange(true) ? interfaceOf<silent>(mb) : nullptr;
}
