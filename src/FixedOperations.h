/**
 * The operations that do nothing but return a fixed status code.
 */
#ifndef FIXEDOPERATIONS_H
#define FIXEDOPERATIONS_H

#include "cmpidt.h"
#include "cmpift.h"

/** Defines an operation of a provider that ignores its arguments and returns the status `code`. */
#define ORV_FIXED_OPERATION(name, code, ...)                                                                           \
    static CMPIStatus name(__VA_ARGS__) {                                                                              \
        return CMPIStatus{code, nullptr};                                                                              \
    }

/**
 * The operations of an instance provider that every class refuses, since clients cannot make or change instances, and
 * its cleanup.
 */
#define ORV_FIXED_INSTANCE_OPERATIONS(Class)                                                                           \
    ORV_FIXED_OPERATION(Class##_Cleanup, CMPI_RC_OK, CMPIInstanceMI*, const CMPIContext*, CMPIBoolean)                 \
    ORV_FIXED_OPERATION(Class##_CreateInstance, CMPI_RC_ERR_NOT_SUPPORTED, CMPIInstanceMI*, const CMPIContext*,        \
                        const CMPIResult*, const CMPIObjectPath*, const CMPIInstance*)                                 \
    ORV_FIXED_OPERATION(Class##_ModifyInstance, CMPI_RC_ERR_NOT_SUPPORTED, CMPIInstanceMI*, const CMPIContext*,        \
                        const CMPIResult*, const CMPIObjectPath*, const CMPIInstance*, const char**)                   \
    ORV_FIXED_OPERATION(Class##_DeleteInstance, CMPI_RC_ERR_NOT_SUPPORTED, CMPIInstanceMI*, const CMPIContext*,        \
                        const CMPIResult*, const CMPIObjectPath*)                                                      \
    ORV_FIXED_OPERATION(Class##_ExecQuery, CMPI_RC_ERR_NOT_SUPPORTED, CMPIInstanceMI*, const CMPIContext*,             \
                        const CMPIResult*, const CMPIObjectPath*, const char*, const char*)

/** The cleanup of an association provider. */
#define ORV_FIXED_ASSOCIATION_OPERATIONS(Class)                                                                        \
    ORV_FIXED_OPERATION(Class##_AssociationCleanup, CMPI_RC_OK, CMPIAssociationMI*, const CMPIContext*, CMPIBoolean)

#endif
