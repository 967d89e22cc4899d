#include "broker/Objects.h"

namespace ObjectManager {

namespace {

template <Text ErrorContent::*member>
CMPIString* getText(const CMPIError* self, CMPIStatus* rc) {
    const ErrorContent* error = contentOf(self, rc);
    return error != nullptr ? returnedString(error->*member, rc) : nullptr;
}

template <Text ErrorContent::*member>
CMPIStatus setText(const CMPIError* self, const char* text) {
    CMPIStatus status;
    ErrorContent* error = contentOf(self, &status);
    if (error != nullptr && text == nullptr) {
        return statusOf(CMPI_RC_ERR_INVALID_PARAMETER);
    }
    if (error != nullptr) {
        assignText(*headerOf(self).memory, error->*member, text);
    }
    return status;
}

/** A code that was never set is 0, which means "unknown" in the properties of CIM_Error. */
template <auto member>
auto getCode(const CMPIError* self, CMPIStatus* rc) {
    const ErrorContent* error = contentOf(self, rc);
    return error != nullptr ? error->*member : decltype(ErrorContent{}.*member){};
}

template <auto member>
CMPIStatus setCode(const CMPIError* self, const std::remove_cvref_t<decltype(ErrorContent{}.*member)> code) {
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

/** Sets one of the arrays, which are arrays of strings. */
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
    Memory& memory = *headerOf(self).memory;
    ArrayContent replaced = std::exchange(error->*member, copy(memory, *texts));
    drop(memory, replaced);
    return status;
}

} // namespace

const CMPIErrorFT errorTable = {
    CMPIVersion200,
    release<CMPIError>,
    clone<CMPIError>,
    getCode<&ErrorContent::type>,
    getText<&ErrorContent::otherType>,
    getText<&ErrorContent::owningEntity>,
    getText<&ErrorContent::messageId>,
    getText<&ErrorContent::message>,
    getCode<&ErrorContent::severity>,
    getCode<&ErrorContent::probableCause>,
    getText<&ErrorContent::probableCauseDescription>,
    getArray<&ErrorContent::recommendedActions>,
    getText<&ErrorContent::source>,
    getCode<&ErrorContent::sourceFormat>,
    getText<&ErrorContent::otherSourceFormat>,
    getCode<&ErrorContent::code>,
    getText<&ErrorContent::codeDescription>,
    getArray<&ErrorContent::messageArguments>,
    setCode<&ErrorContent::type>,
    setText<&ErrorContent::otherType>,
    setText<&ErrorContent::probableCauseDescription>,
    setArray<&ErrorContent::recommendedActions>,
    setText<&ErrorContent::source>,
    setCode<&ErrorContent::sourceFormat>,
    setText<&ErrorContent::otherSourceFormat>,
    setText<&ErrorContent::codeDescription>,
    setArray<&ErrorContent::messageArguments>,
};

} // namespace ObjectManager
