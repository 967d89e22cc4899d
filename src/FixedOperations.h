/**
 * The operations of which only the code that they return is particular.
 */
#ifndef FIXEDOPERATIONS_H
#define FIXEDOPERATIONS_H

#include "cmpidt.h"
#include "cmpift.h"

/** Defines a provider's operation that takes these arguments, uses none of them and returns this code. */
#define ORV_FIXED_OPERATION(name, code, ...)                                                                           \
    static CMPIStatus name(__VA_ARGS__) {                                                                              \
        return CMPIStatus{code, nullptr};                                                                              \
    }

/** The operations of an instance provider that are the same for every class: instances are never made or changed. */
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

/** The operation of an association provider that is the same for every class. */
#define ORV_FIXED_ASSOCIATION_OPERATIONS(Class)                                                                        \
    ORV_FIXED_OPERATION(Class##_AssociationCleanup, CMPI_RC_OK, CMPIAssociationMI*, const CMPIContext*, CMPIBoolean)

#endif
