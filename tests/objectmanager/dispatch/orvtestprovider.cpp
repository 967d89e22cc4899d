/*
 * A provider whose behaviour depends on the requested class: for Test_Disk it is correct, for most other classes it is
 * wrong in the way that the class name tells.
 */
#include "OrvLog/Observer.h"
#include "cmpimacs.h"

#include <unistd.h>

#include <array>
#include <cstdlib>
#include <cstring>
#include <fstream>
#include <map>
#include <stdexcept>
#include <string>
#include <string_view>

namespace {

const CMPIBroker* broker = nullptr;

constexpr CMPIStatus ok{CMPI_RC_OK, nullptr};

CMPIStatus failed(CMPIrc code, const char* message) {
    return {code, CMNewString(broker, message, nullptr)};
}

/** The arguments of an operation. */
struct Call {
    const CMPIContext* context;
    const CMPIResult* result;
    const CMPIObjectPath* path;
    const char** properties;
};

CMPIObjectPath* diskPath(const Call& call, const char* name) {
    CMPIObjectPath* path =
        CMNewObjectPath(broker, CMGetCharPtr(CMGetNameSpace(call.path, nullptr)), "Test_Disk", nullptr);
    CMAddKey(path, "Name", name, CMPI_chars);
    return path;
}

CMPIInstance* disk(const Call& call, const char* name) {
    const CMPIObjectPath* path = diskPath(call, name);
    CMPIInstance* instance = CMNewInstance(broker, path, nullptr);
    std::array<const char*, 2> keys = {"Name", nullptr};
    CMSetPropertyFilter(instance, call.properties, keys.data());
    CMSetProperty(instance, "Name", name, CMPI_chars);
    CMSetProperty(instance, "Vendor", "Test", CMPI_chars);
    const CMPIUint32 size = 512;
    CMSetProperty(instance, "Size", &size, CMPI_uint32);
    return instance;
}

const OrvLog::Observer1* observer = nullptr;

} // namespace

/* This function is the one by which the object manager listens to the agent's log library. */

void orvLogObserve1(const OrvLog::Observer1* given) {
    observer = given;
}

/** Logs a record. Tests call this function, too. */
extern "C" void TestProvider_log(int kind, int level, const char* text) {
    constexpr std::string_view category = "Test.Disk";
    const OrvLog::ObservedRecord1 record{kind, level, category.data(), category.size(), text, std::strlen(text)};
    if (observer != nullptr && level >= observer->lowestLevel) {
        observer->record(observer->context, &record);
    }
}

namespace {

void logRecord(int level, const char* text) {
    TestProvider_log(OrvLog::ORDINARY_RECORD, level, text);
}

using Behaviour = CMPIStatus (*)(const Call&);

const std::map<std::string, Behaviour> behaviours = {
    {"Test_Throws", [](const Call&) -> CMPIStatus { throw std::runtime_error("out of disks"); }},
    {"Test_ThrowsNumber", [](const Call&) -> CMPIStatus { throw 5; }},
    {"Test_Fails", [](const Call&) { return failed(CMPI_RC_ERR_ACCESS_DENIED, "not for you"); }},
    {"Test_FailsSilently",
     [](const Call&) {
         return CMPIStatus{CMPI_RC_ERR_NOT_SUPPORTED, nullptr};
     }},
    {"Test_FailsWithReleasedMessage",
     [](const Call&) {
         const CMPIStatus status = failed(CMPI_RC_ERR_FAILED, "gone");
         CMRelease(status.msg);
         return status;
     }},
    {"Test_ReturnsError",
     [](const Call& call) {
         const CMPIError* error = CMNewCMPIError(broker, "Test", "1", "the disk is on fire", ErrorSevFatal,
                                                 ErrorProbCauseOther, CMPI_RC_ERR_ACCESS_DENIED, nullptr);
         CMReturnError(call.result, error);
         CMReturnDone(call.result);
         return ok;
     }},
    {"Test_LeavesOpen", [](const Call&) { return ok; }},
    {"Test_LeavesOpenAfterFailureLog",
     [](const Call&) {
         logRecord(5000, "looking for disks");
         logRecord(6000, "MESSAGE [File: src/Disk.cpp, Line: 7]: no disk in the bay");
         logRecord(10000, "drive bay is open");
         return ok;
     }},
    {"Test_ReturnsOneAndLeavesOpen",
     [](const Call& call) {
         CMReturnInstance(call.result, disk(call, "a"));
         return ok;
     }},
    {"Test_ClosesEmpty",
     [](const Call& call) {
         CMReturnDone(call.result);
         return ok;
     }},
    {"Test_ReturnsTwo",
     [](const Call& call) {
         CMReturnInstance(call.result, disk(call, "a"));
         CMReturnInstance(call.result, disk(call, "b"));
         CMReturnDone(call.result);
         return ok;
     }},
    {"Test_ReturnsMany",
     [](const Call& call) {
         for (int count = 0; count < 10'000; ++count) {
             CMReturnInstance(call.result, disk(call, "a"));
         }
         CMReturnDone(call.result);
         return ok;
     }},
    {"Test_ReturnsNull",
     [](const Call& call) {
         CMReturnInstance(call.result, nullptr);
         CMReturnDone(call.result);
         return ok;
     }},
    {"Test_ReturnsReleased",
     [](const Call& call) {
         CMPIInstance* instance = disk(call, "a");
         CMRelease(instance);
         CMReturnInstance(call.result, instance);
         CMReturnDone(call.result);
         return ok;
     }},
    {"Test_ReleasesTwice",
     [](const Call& call) {
         CMPIInstance* instance = disk(call, "a");
         CMReturnInstance(call.result, instance);
         CMRelease(instance);
         CMRelease(instance);
         CMReturnDone(call.result);
         return ok;
     }},
    {"Test_ReturnsAfterClose",
     [](const Call& call) {
         CMReturnDone(call.result);
         CMReturnInstance(call.result, disk(call, "a"));
         return ok;
     }},
    {"Test_ReturnsPath",
     [](const Call& call) {
         CMReturnObjectPath(call.result, diskPath(call, "a"));
         CMReturnDone(call.result);
         return ok;
     }},
    {"Test_AsksForItself",
     [](const Call& call) {
         CMPIStatus status = ok;
         CBEnumInstances(broker, call.context, call.path, nullptr, &status);
         return status;
     }},
    {"Test_AsksForDisks",
     [](const Call& call) {
         CMPIStatus status = ok;
         const CMPIObjectPath* disks = CMNewObjectPath(broker, "root/cimv2", "Test_Disk", nullptr);
         const CMPIEnumeration* found = CBEnumInstances(broker, call.context, disks, nullptr, &status);
         while (found != nullptr && CMHasNext(found, nullptr)) {
             CMReturnInstance(call.result, CMGetNext(found, nullptr).value.inst);
         }
         CMReturnDone(call.result);
         return status;
     }},
    {"Test_ShowsContext",
     [](const Call& call) {
         CMPIInstance* instance = CMNewInstance(broker, call.path, nullptr);
         for (CMPICount i = 0; i < CMGetContextEntryCount(call.context, nullptr); ++i) {
             CMPIString* name = nullptr;
             const CMPIData entry = CMGetContextEntryAt(call.context, i, &name, nullptr);
             CMSetProperty(instance, CMGetCharPtr(name), &entry.value, entry.type);
         }
         CMReturnInstance(call.result, instance);
         CMReturnDone(call.result);
         return ok;
     }},
};

/** Behaves in the way that the path's class tells. @return false if the class has no particular behaviour. */
bool behave(const Call& call, CMPIStatus& status) {
    const auto found = behaviours.find(CMGetCharPtr(CMGetClassName(call.path, nullptr)));
    if (found != behaviours.end()) {
        status = found->second(call);
    }
    return found != behaviours.end();
}

CMPIStatus Test_Cleanup(CMPIInstanceMI*, const CMPIContext*, CMPIBoolean terminating) {
    CMLogMessage(broker, CMPI_SEV_INFO, "instance", terminating != 0 ? "terminating" : "cleaning up", nullptr);
    return ok;
}

CMPIStatus Test_EnumInstanceNames(CMPIInstanceMI*, const CMPIContext* context, const CMPIResult* result,
                                  const CMPIObjectPath* path) {
    const Call call{context, result, path, nullptr};
    CMPIStatus status = ok;
    if (!behave(call, status)) {
        for (const char* name : {"a", "b"}) {
            CMReturnObjectPath(result, diskPath(call, name));
        }
        CMReturnDone(result);
    }
    return status;
}

/** The number of disks beside the usual two, for tests that need a large answer. */
int moreDisks() {
    const char* const count = std::getenv("TEST_MORE_DISKS");
    return count == nullptr ? 0 : std::atoi(count);
}

CMPIStatus Test_EnumInstances(CMPIInstanceMI*, const CMPIContext* context, const CMPIResult* result,
                              const CMPIObjectPath* path, const char** properties) {
    const Call call{context, result, path, properties};
    CMPIStatus status = ok;
    if (!behave(call, status)) {
        for (const char* name : {"a", "b"}) {
            CMReturnInstance(result, disk(call, name));
        }
        for (int i = moreDisks(); i > 0; --i) {
            CMReturnInstance(result, disk(call, std::to_string(i).c_str()));
        }
        CMReturnDone(result);
        if (std::getenv("TEST_FAST_DISKS_FAIL") != nullptr && CMClassPathIsA(broker, path, "Test_FastDisk", nullptr)) {
            status = failed(CMPI_RC_ERR_ACCESS_DENIED, "not for 50%\nof you");
        }
    }
    return status;
}

/** Never returns. Writes a byte to the file that TEST_HANGS names, which tells a test that the provider hangs. */
void hang() {
    if (const char* const file = std::getenv("TEST_HANGS")) {
        std::ofstream(file, std::ios::app) << '.';
    }
    while (true) {
        pause();
    }
}

CMPIStatus Test_GetInstance(CMPIInstanceMI*, const CMPIContext* context, const CMPIResult* result,
                            const CMPIObjectPath* path, const char** properties) {
    const Call call{context, result, path, properties};
    CMPIStatus status = ok;
    if (!behave(call, status)) {
        const CMPIString* name = CMGetKey(path, "Name", nullptr).value.string;
        if (std::string_view(CMGetCharPtr(name)) == "hangs") {
            hang();
        }
        CMReturnInstance(result, disk(call, CMGetCharPtr(name)));
        CMReturnDone(result);
    }
    return status;
}

CMPIStatus Test_CreateInstance(CMPIInstanceMI*, const CMPIContext* context, const CMPIResult* result,
                               const CMPIObjectPath* path, const CMPIInstance* instance) {
    const Call call{context, result, path, nullptr};
    CMPIStatus status = ok;
    if (!behave(call, status)) {
        const CMPIString* name = CMGetProperty(instance, "Name", nullptr).value.string;
        CMReturnObjectPath(result, diskPath(call, CMGetCharPtr(name)));
        CMReturnDone(result);
    }
    return status;
}

CMPIStatus Test_ModifyInstance(CMPIInstanceMI*, const CMPIContext* context, const CMPIResult* result,
                               const CMPIObjectPath* path, const CMPIInstance* instance, const char** properties) {
    const Call call{context, result, path, properties};
    CMPIStatus status = ok;
    if (!behave(call, status)) {
        const bool known = CMGetPropertyCount(instance, nullptr) == 1 && properties != nullptr;
        status = known ? ok : failed(CMPI_RC_ERR_INVALID_PARAMETER, "one property and a list are expected");
        CMReturnDone(result);
    }
    return status;
}

CMPIStatus Test_DeleteInstance(CMPIInstanceMI*, const CMPIContext* context, const CMPIResult* result,
                               const CMPIObjectPath* path) {
    const Call call{context, result, path, nullptr};
    CMPIStatus status = ok;
    if (!behave(call, status)) {
        CMReturnDone(result);
    }
    return status;
}

CMPIStatus Test_ExecQuery(CMPIInstanceMI*, const CMPIContext* context, const CMPIResult* result,
                          const CMPIObjectPath* path, const char* query, const char* language) {
    const Call call{context, result, path, nullptr};
    CMPIStatus status = ok;
    if (!behave(call, status)) {
        CMPIInstance* instance = disk(call, query);
        CMSetProperty(instance, "Vendor", language, CMPI_chars);
        CMReturnInstance(result, instance);
        CMReturnDone(result);
    }
    return status;
}

CMPIStatus Test_MethodCleanup(CMPIMethodMI*, const CMPIContext*, CMPIBoolean) {
    throw std::runtime_error("no cleaning today");
}

/** Returns the method's arguments, and their number. */
CMPIStatus Test_InvokeMethod(CMPIMethodMI*, const CMPIContext* context, const CMPIResult* result,
                             const CMPIObjectPath* path, const char* method, const CMPIArgs* in, CMPIArgs* out) {
    const Call call{context, result, path, nullptr};
    CMPIStatus status = ok;
    if (!behave(call, status)) {
        const CMPIUint32 count = CMGetArgCount(in, nullptr);
        for (CMPICount i = 0; i < count; ++i) {
            CMPIString* name = nullptr;
            const CMPIData argument = CMGetArgAt(in, i, &name, nullptr);
            CMAddArg(out, CMGetCharPtr(name), &argument.value, argument.type);
        }
        CMAddArg(out, "Method", method, CMPI_chars);
        CMReturnData(result, &count, CMPI_uint32);
        CMReturnDone(result);
    }
    return status;
}

/* Associations: none of the operations applies the filter or closes its result; association providers need not. */

/** An association operation, and its arguments. */
struct Walk {
    Call call;
    bool references;
    bool names;
    const char* associationClass;
    const char* resultClass;
    const char* role;
    const char* resultRole;
};

void give(const Walk& walk, const CMPIInstance* instance) {
    if (walk.names) {
        CMReturnObjectPath(walk.call.result, CMGetObjectPath(instance, nullptr));
    } else {
        CMReturnInstance(walk.call.result, instance);
    }
}

/** Returns a disk of the host or, for references, the association between the host and the disk. */
void giveDisk(const Walk& walk, const char* name) {
    if (!walk.references) {
        give(walk, disk(walk.call, name));
        return;
    }
    const CMPIObjectPath* path = CMNewObjectPath(broker, "root/cimv2", walk.associationClass, nullptr);
    const CMPIInstance* association = CMNewInstance(broker, path, nullptr);
    const CMPIObjectPath* disk = diskPath(walk.call, name);
    CMSetProperty(association, "Host", &walk.call.path, CMPI_ref);
    CMSetProperty(association, "Disk", &disk, CMPI_ref);
    CMSetProperty(association, "Since", "yesterday", CMPI_chars);
    give(walk, association);
}

const char* orNone(const char* text) {
    return text != nullptr ? text : "none";
}

using Following = CMPIStatus (*)(const Walk&);

const std::map<std::string, Following> followings = {
    {"Test_HasDisk",
     [](const Walk& walk) {
         for (const char* name : {"b", "a", "b"}) {
             giveDisk(walk, name);
         }
         return ok;
     }},
    {"Test_BootsFrom",
     [](const Walk& walk) {
         giveDisk(walk, "a");
         return ok;
     }},
    {"Test_Links",
     [](const Walk& walk) {
         const CMPIObjectPath* path = CMNewObjectPath(broker, "root/cimv2", "Test_Tape", nullptr);
         CMAddKey(path, "Name", "t", CMPI_chars);
         give(walk, CMNewInstance(broker, path, nullptr));
         giveDisk(walk, "c");
         return ok;
     }},
    {"Test_Fails",
     [](const Walk&) {
         logRecord(6000, "no disk in the bay");
         return failed(CMPI_RC_ERR_ACCESS_DENIED, "not for you");
     }},
    {"Test_GivesNothing", [](const Walk&) { return ok; }},
    {"Test_ShowsFilter",
     [](const Walk& walk) {
         CMPIInstance* shown = disk(walk.call, "a");
         CMSetProperty(shown, "Vendor",
                       (std::string(orNone(walk.associationClass)) + ' ' + orNone(walk.resultClass) + ' ' +
                        orNone(walk.role) + ' ' + orNone(walk.resultRole))
                           .c_str(),
                       CMPI_chars);
         give(walk, shown);
         return ok;
     }},
    {"Test_AsksAnother",
     [](const Walk& walk) {
         CMPIStatus status = ok;
         const CMPIEnumeration* found = CBAssociators(broker, walk.call.context, walk.call.path, "Test_HasDisk",
                                                      nullptr, nullptr, nullptr, walk.call.properties, &status);
         CBReferenceNames(broker, walk.call.context, walk.call.path, "Test_HasDisk", nullptr, &status);
         while (found != nullptr && CMHasNext(found, nullptr)) {
             give(walk, CMGetNext(found, nullptr).value.inst);
         }
         return status;
     }},
    {"Test_AsksNobody",
     [](const Walk& walk) {
         CMPIStatus status = ok;
         const CMPIObjectPath* nobody = CMNewObjectPath(broker, "root/cimv2", "Test_Nobody", nullptr);
         CBEnumInstanceNames(broker, walk.call.context, nobody, &status);
         return status;
     }},
    {"Test_AsksForItself",
     [](const Walk& walk) {
         CMPIStatus status = ok;
         CBAssociatorNames(broker, walk.call.context, walk.call.path, walk.associationClass, nullptr, nullptr, nullptr,
                           &status);
         return status;
     }},
};

CMPIStatus follow(const Walk& walk) {
    return followings.at(walk.associationClass)(walk);
}

CMPIStatus Test_AssociationCleanup(CMPIAssociationMI*, const CMPIContext*, CMPIBoolean) {
    return ok;
}

CMPIStatus Test_Associators(CMPIAssociationMI*, const CMPIContext* context, const CMPIResult* result,
                            const CMPIObjectPath* path, const char* associationClass, const char* resultClass,
                            const char* role, const char* resultRole, const char** properties) {
    return follow({{context, result, path, properties}, false, false, associationClass, resultClass, role, resultRole});
}

CMPIStatus Test_AssociatorNames(CMPIAssociationMI*, const CMPIContext* context, const CMPIResult* result,
                                const CMPIObjectPath* path, const char* associationClass, const char* resultClass,
                                const char* role, const char* resultRole) {
    return follow({{context, result, path, nullptr}, false, true, associationClass, resultClass, role, resultRole});
}

CMPIStatus Test_References(CMPIAssociationMI*, const CMPIContext* context, const CMPIResult* result,
                           const CMPIObjectPath* path, const char* associationClass, const char* role,
                           const char** properties) {
    return follow({{context, result, path, properties}, true, false, associationClass, nullptr, role, nullptr});
}

CMPIStatus Test_ReferenceNames(CMPIAssociationMI*, const CMPIContext* context, const CMPIResult* result,
                               const CMPIObjectPath* path, const char* associationClass, const char* role) {
    return follow({{context, result, path, nullptr}, true, true, associationClass, nullptr, role, nullptr});
}

CMInstanceMIStub(Test_, TestProvider, broker, CMNoHook)

CMMethodMIStub(Test_, TestProvider, broker, CMNoHook)

CMAssociationMIStub(Test_, TestProvider, broker, CMNoHook)

} // namespace
