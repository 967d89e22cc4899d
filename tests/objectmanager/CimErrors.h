/** How an operation of the object manager failed, for tests. */
#ifndef TESTS_OBJECTMANAGER_CIMERRORS_H
#define TESTS_OBJECTMANAGER_CIMERRORS_H

#include "model/CimError.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <string>

namespace ObjectManager {

/** The code and text of the CimError that `call` throws; a failure of the test where it throws none. */
template <typename Call>
CimError errorOf(Call call) {
    try {
        call();
    } catch (const CimError& error) {
        return error;
    }
    ADD_FAILURE() << "no CimError";
    return {CMPI_RC_OK, ""};
}

inline auto isError(CMPIrc code, const std::string& message) {
    return testing::AllOf(testing::Field("code", &CimError::code, code),
                          testing::Property("what()", &CimError::what, testing::StrEq(message)));
}

} // namespace ObjectManager

#endif
