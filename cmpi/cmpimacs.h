/**
 * The convenience layer of the Common Manageability Programming Interface, version 2.0 (The Open Group, C061): one call
 * for each slot of the function tables, and the stub macros that define a provider's tables and factory functions.
 *
 * Each macro calls its slot directly, with the arguments in the order shown; `rc` is the trailing status pointer and
 * may be null. The macros do not check objects and tables for null.
 */
#ifndef CMPIMACS_H
#define CMPIMACS_H

#include "cmpidt.h"
#include "cmpift.h"

/* Status */

#define CMReturn(code)                                                                                                 \
    {                                                                                                                  \
        CMPIStatus cmpiStatus_ = {(code), NULL};                                                                       \
        return cmpiStatus_;                                                                                            \
    }

#define CMReturnWithString(code, string)                                                                               \
    {                                                                                                                  \
        CMPIStatus cmpiStatus_ = {(code), (string)};                                                                   \
        return cmpiStatus_;                                                                                            \
    }

#define CMReturnWithChars(mb, code, chars)                                                                             \
    {                                                                                                                  \
        CMPIStatus cmpiStatus_ = {(code), NULL};                                                                       \
        CMSetStatusWithChars((mb), &cmpiStatus_, (code), (chars));                                                     \
        return cmpiStatus_;                                                                                            \
    }

/** If `st` is not null, sets its code, and a null message. */
#define CMSetStatus(st, code)                                                                                          \
    do {                                                                                                               \
        if ((st) != NULL) {                                                                                            \
            (st)->rc = (code);                                                                                         \
            (st)->msg = NULL;                                                                                          \
        }                                                                                                              \
    } while (0)

/** If `st` is not null, sets its code and message. */
#define CMSetStatusWithString(st, code, string)                                                                        \
    do {                                                                                                               \
        if ((st) != NULL) {                                                                                            \
            (st)->rc = (code);                                                                                         \
            (st)->msg = (string);                                                                                      \
        }                                                                                                              \
    } while (0)

/**
 * If `st` is not null, sets its code, and as its message a new string with the text `chars`; without a broker `mb`, a
 * null message.
 */
#define CMSetStatusWithChars(mb, st, code, chars)                                                                      \
    do {                                                                                                               \
        if ((st) != NULL) {                                                                                            \
            (st)->rc = (code);                                                                                         \
            (st)->msg = (mb) != NULL ? (mb)->eft->newString((mb), (chars), NULL) : NULL;                               \
        }                                                                                                              \
    } while (0)

/* Any object */

/** True when the pointer is null or its object holds nothing. */
#define CMIsNullObject(obj) ((obj) == NULL || (obj)->hdl == NULL)
#define CMIsNullValue(data) (((data).state & CMPI_nullValue) != 0)
#define CMIsKeyValue(data) (((data).state & CMPI_keyValue) != 0)
#define CMIsArray(data) (((data).type & CMPI_ARRAY) != 0)
#define CMRelease(obj) ((obj)->ft->release((obj)))
#define CMClone(obj, rc) ((obj)->ft->clone((obj), (rc)))

/* Broker: new objects and services */

#define CMNewInstance(mb, op, rc) ((mb)->eft->newInstance((mb), (op), (rc)))
#define CMNewObjectPath(mb, ns, cn, rc) ((mb)->eft->newObjectPath((mb), (ns), (cn), (rc)))
#define CMNewArgs(mb, rc) ((mb)->eft->newArgs((mb), (rc)))
#define CMNewString(mb, chars, rc) ((mb)->eft->newString((mb), (chars), (rc)))
#define CMNewArray(mb, count, type, rc) ((mb)->eft->newArray((mb), (count), (type), (rc)))
#define CMNewDateTime(mb, rc) ((mb)->eft->newDateTime((mb), (rc)))
#define CMNewDateTimeFromBinary(mb, binary, interval, rc)                                                              \
    ((mb)->eft->newDateTimeFromBinary((mb), (binary), (interval), (rc)))
#define CMNewDateTimeFromChars(mb, utc, rc) ((mb)->eft->newDateTimeFromChars((mb), (utc), (rc)))
#define CMNewSelectExp(mb, query, language, projection, rc)                                                            \
    ((mb)->eft->newSelectExp((mb), (query), (language), (projection), (rc)))
#define CMClassPathIsA(mb, op, type, rc) ((mb)->eft->classPathIsA((mb), (op), (type), (rc)))
#define CDToString(mb, object, rc) ((mb)->eft->toString((mb), (object), (rc)))
#define CDIsOfType(mb, object, type, rc) ((mb)->eft->isOfType((mb), (object), (type), (rc)))
#define CDGetType(mb, object, rc) ((mb)->eft->getType((mb), (object), (rc)))
#define CMLogMessage(mb, severity, id, text, string) ((mb)->eft->logMessage((mb), (severity), (id), (text), (string)))
#define CMTraceMessage(mb, level, component, text, string)                                                             \
    ((mb)->eft->trace((mb), (level), (component), (text), (string)))
#define CMNewCMPIError(mb, owner, id, text, severity, cause, code, rc)                                                 \
    ((mb)->eft->newCMPIError((mb), (owner), (id), (text), (severity), (cause), (code), (rc)))
#define CMOpenMessageFile(mb, file, handle) ((mb)->eft->openMessageFile((mb), (file), (handle)))
#define CMCloseMessageFile(mb, handle) ((mb)->eft->closeMessageFile((mb), (handle)))

/* Broker: up-calls */

#define CBPrepareAttachThread(mb, ctx) ((mb)->bft->prepareAttachThread((mb), (ctx)))
#define CBAttachThread(mb, ctx) ((mb)->bft->attachThread((mb), (ctx)))
#define CBDetachThread(mb, ctx) ((mb)->bft->detachThread((mb), (ctx)))
#define CBDeliverIndication(mb, ctx, ns, inst) ((mb)->bft->deliverIndication((mb), (ctx), (ns), (inst)))
#define CBEnumInstanceNames(mb, ctx, op, rc) ((mb)->bft->enumerateInstanceNames((mb), (ctx), (op), (rc)))
#define CBGetInstance(mb, ctx, op, properties, rc) ((mb)->bft->getInstance((mb), (ctx), (op), (properties), (rc)))
#define CBCreateInstance(mb, ctx, op, inst, rc) ((mb)->bft->createInstance((mb), (ctx), (op), (inst), (rc)))
#define CBModifyInstance(mb, ctx, op, inst, properties)                                                                \
    ((mb)->bft->modifyInstance((mb), (ctx), (op), (inst), (properties)))
#define CBDeleteInstance(mb, ctx, op) ((mb)->bft->deleteInstance((mb), (ctx), (op)))
#define CBExecQuery(mb, ctx, op, query, language, rc)                                                                  \
    ((mb)->bft->execQuery((mb), (ctx), (op), (query), (language), (rc)))
#define CBEnumInstances(mb, ctx, op, properties, rc)                                                                   \
    ((mb)->bft->enumerateInstances((mb), (ctx), (op), (properties), (rc)))
#define CBAssociators(mb, ctx, op, assocClass, resultClass, role, resultRole, properties, rc)                          \
    ((mb)->bft->associators((mb), (ctx), (op), (assocClass), (resultClass), (role), (resultRole), (properties), (rc)))
#define CBAssociatorNames(mb, ctx, op, assocClass, resultClass, role, resultRole, rc)                                  \
    ((mb)->bft->associatorNames((mb), (ctx), (op), (assocClass), (resultClass), (role), (resultRole), (rc)))
#define CBReferences(mb, ctx, op, resultClass, role, properties, rc)                                                   \
    ((mb)->bft->references((mb), (ctx), (op), (resultClass), (role), (properties), (rc)))
#define CBReferenceNames(mb, ctx, op, resultClass, role, rc)                                                           \
    ((mb)->bft->referenceNames((mb), (ctx), (op), (resultClass), (role), (rc)))
#define CBInvokeMethod(mb, ctx, op, method, in, out, rc)                                                               \
    ((mb)->bft->invokeMethod((mb), (ctx), (op), (method), (in), (out), (rc)))
#define CBSetProperty(mb, ctx, op, name, value, type)                                                                  \
    ((mb)->bft->setProperty((mb), (ctx), (op), (name), (const CMPIValue*)(value), (type)))
#define CBGetProperty(mb, ctx, op, name, rc) ((mb)->bft->getProperty((mb), (ctx), (op), (name), (rc)))

#define CBBrokerCapabilities(mb) ((mb)->bft->brokerCapabilities)
#define CBBrokerVersion(mb) ((mb)->bft->brokerVersion)
#define CBBrokerName(mb) ((mb)->bft->brokerName)

/* Broker: memory */

#define CMMark(mb, rc) ((mb)->mft->mark((mb), (rc)))
#define CMFree(mb, mark) ((mb)->mft->release((mb), (mark)))

/* String */

#define CMGetCharsPtr(str, rc) ((str)->ft->getCharPtr((str), (rc)))
#define CMGetCharPtr(str) CMGetCharsPtr((str), NULL)

/* Object path */

#define CMSetNameSpace(op, chars) ((op)->ft->setNameSpace((op), (chars)))
#define CMGetNameSpace(op, rc) ((op)->ft->getNameSpace((op), (rc)))
#define CMSetHostname(op, chars) ((op)->ft->setHostname((op), (chars)))
#define CMGetHostname(op, rc) ((op)->ft->getHostname((op), (rc)))
#define CMSetClassName(op, chars) ((op)->ft->setClassName((op), (chars)))
#define CMGetClassName(op, rc) ((op)->ft->getClassName((op), (rc)))
#define CMAddKey(op, name, value, type) ((op)->ft->addKey((op), (name), (const CMPIValue*)(value), (type)))
#define CMGetKey(op, name, rc) ((op)->ft->getKey((op), (name), (rc)))
#define CMGetKeyAt(op, index, name, rc) ((op)->ft->getKeyAt((op), (index), (name), (rc)))
#define CMGetKeyCount(op, rc) ((op)->ft->getKeyCount((op), (rc)))
#define CMSetNameSpaceFromObjectPath(op, source) ((op)->ft->setNameSpaceFromObjectPath((op), (source)))
#define CMSetHostAndNameSpaceFromObjectPath(op, source) ((op)->ft->setHostAndNameSpaceFromObjectPath((op), (source)))
#define CMGetClassQualifier(op, name, rc) ((op)->ft->getClassQualifier((op), (name), (rc)))
#define CMGetPropertyQualifier(op, property, name, rc) ((op)->ft->getPropertyQualifier((op), (property), (name), (rc)))
#define CMGetMethodQualifier(op, method, name, rc) ((op)->ft->getMethodQualifier((op), (method), (name), (rc)))
#define CMGetParameterQualifier(op, method, parameter, name, rc)                                                       \
    ((op)->ft->getParameterQualifier((op), (method), (parameter), (name), (rc)))
#define CMObjectPathToString(op, rc) ((op)->ft->toString((op), (rc)))

/* Instance */

#define CMSetProperty(inst, name, value, type)                                                                         \
    ((inst)->ft->setProperty((inst), (name), (const CMPIValue*)(value), (type)))
#define CMSetPropertyWithOrigin(inst, name, value, type, origin)                                                       \
    ((inst)->ft->setPropertyWithOrigin((inst), (name), (const CMPIValue*)(value), (type), (origin)))
#define CMGetProperty(inst, name, rc) ((inst)->ft->getProperty((inst), (name), (rc)))
#define CMGetPropertyAt(inst, index, name, rc) ((inst)->ft->getPropertyAt((inst), (index), (name), (rc)))
#define CMGetPropertyCount(inst, rc) ((inst)->ft->getPropertyCount((inst), (rc)))
#define CMGetObjectPath(inst, rc) ((inst)->ft->getObjectPath((inst), (rc)))
#define CMSetObjectPath(inst, op) ((inst)->ft->setObjectPath((inst), (op)))
#define CMSetPropertyFilter(inst, properties, keys) ((inst)->ft->setPropertyFilter((inst), (properties), (keys)))

/* Arguments */

#define CMAddArg(args, name, value, type) ((args)->ft->addArg((args), (name), (const CMPIValue*)(value), (type)))
#define CMGetArg(args, name, rc) ((args)->ft->getArg((args), (name), (rc)))
#define CMGetArgAt(args, index, name, rc) ((args)->ft->getArgAt((args), (index), (name), (rc)))
#define CMGetArgCount(args, rc) ((args)->ft->getArgCount((args), (rc)))

/* Array */

#define CMGetArrayCount(ar, rc) ((ar)->ft->getSize((ar), (rc)))
#define CMGetArrayType(ar, rc) ((ar)->ft->getSimpleType((ar), (rc)))
#define CMGetArrayElementAt(ar, index, rc) ((ar)->ft->getElementAt((ar), (index), (rc)))
#define CMSetArrayElementAt(ar, index, value, type)                                                                    \
    ((ar)->ft->setElementAt((ar), (index), (const CMPIValue*)(value), (type)))

/* Enumeration */

#define CMHasNext(en, rc) ((en)->ft->hasNext((en), (rc)))
#define CMGetNext(en, rc) ((en)->ft->getNext((en), (rc)))
#define CMToArray(en, rc) ((en)->ft->toArray((en), (rc)))

/* Date and time */

#define CMGetBinaryFormat(dt, rc) ((dt)->ft->getBinaryFormat((dt), (rc)))
#define CMGetStringFormat(dt, rc) ((dt)->ft->getStringFormat((dt), (rc)))
#define CMIsInterval(dt, rc) ((dt)->ft->isInterval((dt), (rc)))

/* Context */

#define CMGetContextEntry(ctx, name, rc) ((ctx)->ft->getEntry((ctx), (name), (rc)))
#define CMGetContextEntryAt(ctx, index, name, rc) ((ctx)->ft->getEntryAt((ctx), (index), (name), (rc)))
#define CMGetContextEntryCount(ctx, rc) ((ctx)->ft->getEntryCount((ctx), (rc)))
#define CMAddContextEntry(ctx, name, value, type)                                                                      \
    ((ctx)->ft->addEntry((ctx), (name), (const CMPIValue*)(value), (type)))

/* Result */

#define CMReturnData(result, value, type) ((result)->ft->returnData((result), (const CMPIValue*)(value), (type)))
#define CMReturnInstance(result, inst) ((result)->ft->returnInstance((result), (inst)))
#define CMReturnObjectPath(result, op) ((result)->ft->returnObjectPath((result), (op)))
#define CMReturnDone(result) ((result)->ft->returnDone((result)))
#define CMReturnError(result, error) ((result)->ft->returnError((result), (error)))

/* Select expressions */

#define CMEvaluateSelExp(se, inst, rc) ((se)->ft->evaluate((se), (inst), (rc)))
#define CMEvaluateSelExpUsingAccessor(se, accessor, parm, rc)                                                          \
    ((se)->ft->evaluateUsingAccessor((se), (accessor), (parm), (rc)))
#define CMGetSelExpString(se, rc) ((se)->ft->getString((se), (rc)))
#define CMGetDoc(se, rc) ((se)->ft->getDOC((se), (rc)))
#define CMGetCod(se, rc) ((se)->ft->getCOD((se), (rc)))
#define CMGetSubCondCountAndType(sc, type, rc) ((sc)->ft->getCountAndType((sc), (type), (rc)))
#define CMGetSubCondAt(sc, index, rc) ((sc)->ft->getSubCondAt((sc), (index), (rc)))
#define CMGetPredicateCount(sc, rc) ((sc)->ft->getCount((sc), (rc)))
#define CMGetPredicateAt(sc, index, rc) ((sc)->ft->getPredicateAt((sc), (index), (rc)))
#define CMGetPredicate(sc, name, rc) ((sc)->ft->getPredicate((sc), (name), (rc)))
#define CMGetPredicateData(pr, type, op, left, right) ((pr)->ft->getData((pr), (type), (op), (left), (right)))
#define CMEvaluatePredicateUsingAccessor(pr, accessor, parm, rc)                                                       \
    ((pr)->ft->evaluateUsingAccessor((pr), (accessor), (parm), (rc)))

/*
 * Stubs. Each defines the static function table of one kind of provider, and its exported factory function
 * `<provider>_Create_<Kind>MI`. `pfx` is the prefix of the operations' names, `pn` the provider's name, `broker` the
 * variable that keeps the broker, and `hook` a statement that each call of the factory runs (CMNoHook for none). The
 * object manager calls a factory before the functions of the table that it returns; it may call the factory again, from
 * any thread.
 */

#define CMNoHook

#define CMPI_FACTORY_(Kind, table, pn, broker, hook)                                                                   \
    CMPI_EXTERN_C CMPI##Kind##MI* pn##_Create_##Kind##MI(const CMPIBroker* brkr, const CMPIContext* ctx,               \
                                                         CMPIStatus* rc) {                                             \
        static CMPI##Kind##MI mi = {NULL, &table};                                                                     \
        (void)ctx;                                                                                                     \
        (void)rc;                                                                                                      \
        broker = brkr;                                                                                                 \
        hook;                                                                                                          \
        return &mi;                                                                                                    \
    }

#define CMInstanceMIStub(pfx, pn, broker, hook)                                                                        \
    static CMPIInstanceMIFT instMIFT__ = {                                                                             \
        CMPICurrentVersion,     CMPICurrentVersion,  "instance" #pn,   pfx##Cleanup,                                   \
        pfx##EnumInstanceNames, pfx##EnumInstances,  pfx##GetInstance, pfx##CreateInstance,                            \
        pfx##ModifyInstance,    pfx##DeleteInstance, pfx##ExecQuery,                                                   \
    };                                                                                                                 \
    CMPI_FACTORY_(Instance, instMIFT__, pn, broker, hook)

#define CMAssociationMIStub(pfx, pn, broker, hook)                                                                     \
    static CMPIAssociationMIFT assocMIFT__ = {                                                                         \
        CMPICurrentVersion, CMPICurrentVersion,   "association" #pn, pfx##AssociationCleanup,                          \
        pfx##Associators,   pfx##AssociatorNames, pfx##References,   pfx##ReferenceNames,                              \
    };                                                                                                                 \
    CMPI_FACTORY_(Association, assocMIFT__, pn, broker, hook)

#define CMMethodMIStub(pfx, pn, broker, hook)                                                                          \
    static CMPIMethodMIFT methMIFT__ = {                                                                               \
        CMPICurrentVersion, CMPICurrentVersion, "method" #pn, pfx##MethodCleanup, pfx##InvokeMethod,                   \
    };                                                                                                                 \
    CMPI_FACTORY_(Method, methMIFT__, pn, broker, hook)

#define CMPropertyMIStub(pfx, pn, broker, hook)                                                                        \
    static CMPIPropertyMIFT propMIFT__ = {                                                                             \
        CMPICurrentVersion, CMPICurrentVersion,         "property" #pn, pfx##PropertyCleanup, pfx##SetProperty,        \
        pfx##GetProperty,   pfx##SetPropertyWithOrigin,                                                                \
    };                                                                                                                 \
    CMPI_FACTORY_(Property, propMIFT__, pn, broker, hook)

#define CMIndicationMIStub(pfx, pn, broker, hook)                                                                      \
    static CMPIIndicationMIFT indMIFT__ = {                                                                            \
        CMPICurrentVersion,                                                                                            \
        CMPICurrentVersion,                                                                                            \
        "indication" #pn,                                                                                              \
        pfx##IndicationCleanup,                                                                                        \
        pfx##AuthorizeFilter,                                                                                          \
        pfx##MustPoll,                                                                                                 \
        pfx##ActivateFilter,                                                                                           \
        pfx##DeActivateFilter,                                                                                         \
        pfx##EnableIndications,                                                                                        \
        pfx##DisableIndications,                                                                                       \
        pfx##AuthorizeFilterCollection,                                                                                \
        pfx##ActivateFilterCollection,                                                                                 \
        pfx##DeActivateFilterCollection,                                                                               \
    };                                                                                                                 \
    CMPI_FACTORY_(Indication, indMIFT__, pn, broker, hook)

#endif
