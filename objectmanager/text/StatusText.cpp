#include "text/StatusText.h"

#include "model/CimError.h"

#include <algorithm>
#include <array>
#include <string_view>

namespace ObjectManager {

namespace {

struct CodeName {
    CMPIrc code;
    std::string_view name;
};

constexpr std::array<CodeName, 25> codeNames{
    {{CMPI_RC_OK, "CIM_OK"},
     {CMPI_RC_ERR_FAILED, "CIM_ERR_FAILED"},
     {CMPI_RC_ERR_ACCESS_DENIED, "CIM_ERR_ACCESS_DENIED"},
     {CMPI_RC_ERR_INVALID_NAMESPACE, "CIM_ERR_INVALID_NAMESPACE"},
     {CMPI_RC_ERR_INVALID_PARAMETER, "CIM_ERR_INVALID_PARAMETER"},
     {CMPI_RC_ERR_INVALID_CLASS, "CIM_ERR_INVALID_CLASS"},
     {CMPI_RC_ERR_NOT_FOUND, "CIM_ERR_NOT_FOUND"},
     {CMPI_RC_ERR_NOT_SUPPORTED, "CIM_ERR_NOT_SUPPORTED"},
     {CMPI_RC_ERR_CLASS_HAS_CHILDREN, "CIM_ERR_CLASS_HAS_CHILDREN"},
     {CMPI_RC_ERR_CLASS_HAS_INSTANCES, "CIM_ERR_CLASS_HAS_INSTANCES"},
     {CMPI_RC_ERR_INVALID_SUPERCLASS, "CIM_ERR_INVALID_SUPERCLASS"},
     {CMPI_RC_ERR_ALREADY_EXISTS, "CIM_ERR_ALREADY_EXISTS"},
     {CMPI_RC_ERR_NO_SUCH_PROPERTY, "CIM_ERR_NO_SUCH_PROPERTY"},
     {CMPI_RC_ERR_TYPE_MISMATCH, "CIM_ERR_TYPE_MISMATCH"},
     {CMPI_RC_ERR_QUERY_LANGUAGE_NOT_SUPPORTED, "CIM_ERR_QUERY_LANGUAGE_NOT_SUPPORTED"},
     {CMPI_RC_ERR_INVALID_QUERY, "CIM_ERR_INVALID_QUERY"},
     {CMPI_RC_ERR_METHOD_NOT_AVAILABLE, "CIM_ERR_METHOD_NOT_AVAILABLE"},
     {CMPI_RC_ERR_METHOD_NOT_FOUND, "CIM_ERR_METHOD_NOT_FOUND"},
     {serverLimitsExceeded, "CIM_ERR_SERVER_LIMITS_EXCEEDED"},
     {CMPI_RC_DO_NOT_UNLOAD, "CMPI_RC_DO_NOT_UNLOAD"},
     {CMPI_RC_NEVER_UNLOAD, "CMPI_RC_NEVER_UNLOAD"},
     {CMPI_RC_ERR_INVALID_HANDLE, "CMPI_RC_ERR_INVALID_HANDLE"},
     {CMPI_RC_ERR_INVALID_DATA_TYPE, "CMPI_RC_ERR_INVALID_DATA_TYPE"},
     {CMPI_RC_ERROR_SYSTEM, "CMPI_RC_ERROR_SYSTEM"},
     {CMPI_RC_ERROR, "CMPI_RC_ERROR"}}};

} // namespace

std::string statusText(CMPIrc code) {
    const auto* const found =
        std::find_if(codeNames.begin(), codeNames.end(), [code](const CodeName& c) { return c.code == code; });
    const std::string_view name = found == codeNames.end() ? "return code" : found->name;
    return std::string(name) + " (" + std::to_string(static_cast<int>(code)) + ")";
}

std::string reasonsText(const std::vector<std::string>& messages, const char* introduction) {
    std::string text;
    for (auto message = messages.begin(); message != messages.end(); ++message) {
        if (std::find(messages.begin(), message, *message) == message) {
            text += (text.empty() ? introduction : "; ") + *message;
        }
    }
    return text;
}

} // namespace ObjectManager
