/** Helpers for tests of operations that fail with a CimError. */
#ifndef TESTS_OBJECTMANAGER_CIMERRORS_H
#define TESTS_OBJECTMANAGER_CIMERRORS_H

#include "model/CimError.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <string>

namespace ObjectManager {

/** The code and text of the CimError that `call` throws; if it throws none, the test fails. */
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
