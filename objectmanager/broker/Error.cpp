#include "broker/Objects.h"

namespace ObjectManager {

namespace {

template <ErrorContent::TextOf which>
CMPIString* getText(const CMPIError* self, CMPIStatus* rc) {
    const ErrorContent* error = contentOf(self, rc);
    return error != nullptr ? returnedString(error->texts[which], rc) : nullptr;
}

template <ErrorContent::TextOf which>
CMPIStatus setText(const CMPIError* self, const char* text) {
    CMPIStatus status;
    ErrorContent* error = contentOf(self, &status);
    if (error != nullptr && text == nullptr) {
        return statusOf(CMPI_RC_ERR_INVALID_PARAMETER);
    }
    if (error != nullptr) {
        error->texts[which] = text;
    }
    return status;
}

/** A code that was not set reads as 0, as everywhere in CIM_Error. */
template <auto member>
auto getCode(const CMPIError* self, CMPIStatus* rc) {
    const ErrorContent* error = contentOf(self, rc);
    return error != nullptr ? error->*member : decltype(ErrorCodes{}.*member){};
}

template <auto member>
CMPIStatus setCode(const CMPIError* self, const std::remove_cvref_t<decltype(ErrorCodes{}.*member)> code) {
    CMPIStatus status;
    ErrorContent* error = contentOf(self, &status);
    if (error != nullptr) {
        error->*member = code;
    }
    return status;
}

template <ArrayContent ErrorContent::*member>
CMPIArray* getArray(const CMPIError* self, CMPIStatus* rc) {
    const ErrorContent* error = contentOf(self, rc);
    return error != nullptr ? returnedCopy<CMPIArray>(error->*member, rc) : nullptr;
}

/** Of strings. */
template <ArrayContent ErrorContent::*member>
CMPIStatus setArray(const CMPIError* self, const CMPIArray* array) {
    CMPIStatus status;
    ErrorContent* error = contentOf(self, &status);
    const ArrayContent* texts = error != nullptr ? contentOf(array, &status) : nullptr;
    if (texts == nullptr) {
        return status;
    }
    if (texts->elementType != CMPI_string) {
        return statusOf(CMPI_RC_ERR_TYPE_MISMATCH);
    }
    Value::Array& elements = (error->*member).elements;
    elements = Value::Array(texts->elements, elements.get_allocator());
    return status;
}

} // namespace

const CMPIErrorFT errorTable = {
    CMPIVersion200,
    release<CMPIError>,
    clone<CMPIError>,
    getCode<&ErrorCodes::type>,
    getText<ErrorContent::otherType>,
    getText<ErrorContent::owningEntity>,
    getText<ErrorContent::messageId>,
    getText<ErrorContent::message>,
    getCode<&ErrorCodes::severity>,
    getCode<&ErrorCodes::probableCause>,
    getText<ErrorContent::probableCauseDescription>,
    getArray<&ErrorContent::recommendedActions>,
    getText<ErrorContent::source>,
    getCode<&ErrorCodes::sourceFormat>,
    getText<ErrorContent::otherSourceFormat>,
    getCode<&ErrorCodes::code>,
    getText<ErrorContent::codeDescription>,
    getArray<&ErrorContent::messageArguments>,
    setCode<&ErrorCodes::type>,
    setText<ErrorContent::otherType>,
    setText<ErrorContent::probableCauseDescription>,
    setArray<&ErrorContent::recommendedActions>,
    setText<ErrorContent::source>,
    setCode<&ErrorCodes::sourceFormat>,
    setText<ErrorContent::otherSourceFormat>,
    setText<ErrorContent::codeDescription>,
    setArray<&ErrorContent::messageArguments>,
};

} // namespace ObjectManager
