#include "host/broker/Slot.h"

namespace marlo::broker {

namespace {

template <auto Member>
CMPIString* getText(CMPIStatus&, ErrorObject& error) {
    StringObject* text = error.*Member;
    return text == nullptr ? nullptr : &text->handle;
}

template <auto Member>
CMPIrc setText(ErrorObject& error, const char* text) {
    if (text == nullptr) {
        return CMPI_RC_ERR_INVALID_PARAMETER;
    }
    error.*Member = StringObject::make(error.arena(), text);
    return CMPI_RC_OK;
}

template <auto Member>
CMPIArray* getArray(CMPIStatus&, ErrorObject& error) {
    ArrayObject* array = error.*Member;
    return array == nullptr ? nullptr : &array->handle;
}

template <auto Member>
CMPIrc setTexts(ErrorObject& error, const CMPIArray* handle) {
    const auto* array = objectOf<ArrayObject>(handle);
    if (array == nullptr) {
        return CMPI_RC_ERR_INVALID_HANDLE;
    }
    if (array->elementType != CMPI_string) {
        return CMPI_RC_ERR_TYPE_MISMATCH;
    }
    error.*Member = array->copyTo(error.arena());
    return CMPI_RC_OK;
}

template <auto Member, typename T>
T getNumber(CMPIStatus&, ErrorObject& error) {
    return error.*Member;
}

template <auto Member, typename T>
CMPIrc setNumber(ErrorObject& error, T value) {
    error.*Member = value;
    return CMPI_RC_OK;
}

StringObject* copied(StringObject* text, Arena& target) {
    return text == nullptr ? nullptr : text->copyTo(target);
}

ArrayObject* copied(const ArrayObject* array, Arena& target) {
    return array == nullptr ? nullptr : array->copyTo(target);
}

} // namespace

ErrorObject* ErrorObject::copyTo(Arena& target) const {
    ErrorObject* copy = make(target);
    copy->type = type;
    copy->severity = severity;
    copy->cause = cause;
    copy->sourceFormat = sourceFormat;
    copy->code = code;
    for (const auto member : {&ErrorObject::otherType, &ErrorObject::owningEntity, &ErrorObject::messageId,
                              &ErrorObject::message, &ErrorObject::causeDescription, &ErrorObject::source,
                              &ErrorObject::otherSourceFormat, &ErrorObject::codeDescription}) {
        copy->*member = copied(this->*member, target);
    }
    copy->recommendedActions = copied(recommendedActions, target);
    copy->messageArguments = copied(messageArguments, target);
    return copy;
}

const CMPIErrorFT errorTable = {
    CMPI_VERSION,
    releaseSlot<ErrorObject>,
    slot<cloneOperation<ErrorObject>>,
    slot<getNumber<&ErrorObject::type, CMPIErrorType>>,
    slot<getText<&ErrorObject::otherType>>,
    slot<getText<&ErrorObject::owningEntity>>,
    slot<getText<&ErrorObject::messageId>>,
    slot<getText<&ErrorObject::message>>,
    slot<getNumber<&ErrorObject::severity, CMPIErrorSeverity>>,
    slot<getNumber<&ErrorObject::cause, CMPIErrorProbableCause>>,
    slot<getText<&ErrorObject::causeDescription>>,
    slot<getArray<&ErrorObject::recommendedActions>>,
    slot<getText<&ErrorObject::source>>,
    slot<getNumber<&ErrorObject::sourceFormat, CMPIErrorSrcFormat>>,
    slot<getText<&ErrorObject::otherSourceFormat>>,
    slot<getNumber<&ErrorObject::code, CMPIrc>>,
    slot<getText<&ErrorObject::codeDescription>>,
    slot<getArray<&ErrorObject::messageArguments>>,
    slot<setNumber<&ErrorObject::type, CMPIErrorType>>,
    slot<setText<&ErrorObject::otherType>>,
    slot<setText<&ErrorObject::causeDescription>>,
    slot<setTexts<&ErrorObject::recommendedActions>>,
    slot<setText<&ErrorObject::source>>,
    slot<setNumber<&ErrorObject::sourceFormat, CMPIErrorSrcFormat>>,
    slot<setText<&ErrorObject::otherSourceFormat>>,
    slot<setText<&ErrorObject::codeDescription>>,
    slot<setTexts<&ErrorObject::messageArguments>>,
};

} // namespace marlo::broker
