#include "text/StatusText.h"

#include <gtest/gtest.h>

namespace ObjectManager {
namespace {

TEST(StatusText, NamesTheCodesOfOperationsAndOfTheProviderInterface) {
    EXPECT_EQ(statusText(CMPI_RC_ERR_FAILED), "CIM_ERR_FAILED (1)");
    EXPECT_EQ(statusText(CMPI_RC_ERR_NOT_FOUND), "CIM_ERR_NOT_FOUND (6)");
    EXPECT_EQ(statusText(CMPI_RC_ERR_METHOD_NOT_FOUND), "CIM_ERR_METHOD_NOT_FOUND (17)");
    EXPECT_EQ(statusText(CMPI_RC_ERROR_SYSTEM), "CMPI_RC_ERROR_SYSTEM (100)");
    EXPECT_EQ(statusText(CMPI_RC_ERROR), "CMPI_RC_ERROR (200)");
}

TEST(StatusText, GivesAnyOtherCodeByItsNumber) {
    EXPECT_EQ(statusText(static_cast<CMPIrc>(123)), "return code (123)");
}

} // namespace
} // namespace ObjectManager
