/*
 * Does in plain C what an object manager does with the provider library: loads it by its file name, calls its factories
 * and operations through the function tables, and unloads it.
 *
 *   provider_host LIBRARY NAMESAKES CASE
 *
 * NAMESAKES is a library that has functions with the same names as the provider library. Each case is one test. At the
 * first failure, the program prints it to standard error and ends with exit status 1.
 */
#include "broker.h"

#include "cmpimacs.h"

#include <dlfcn.h>
#include <malloc.h>
#include <pthread.h>
#include <stdio.h>
#include <stdlib.h>
#include <string.h>
#include <unistd.h>

static const char* libraryFile;
static const char* namesakesFile;

static _Noreturn void fail(const char* file, int line, const char* what, const char* detail) {
    fprintf(stderr, "%s:%d: %s%s%s\n", file, line, what, detail == NULL ? "" : ": ", detail == NULL ? "" : detail);
    exit(EXIT_FAILURE);
}

#define EXPECT(condition) ((condition) ? (void)0 : fail(__FILE__, __LINE__, "expected " #condition, NULL))
/* Requires that a call succeeded. If it failed, the reason is in dlerror(). */
#define EXPECT_LOADED(condition) ((condition) ? (void)0 : fail(__FILE__, __LINE__, #condition, dlerror()))
#define EXPECT_TEXT(actual, expected)                                                                                  \
    (strcmp((actual), (expected)) == 0 ? (void)0 : fail(__FILE__, __LINE__, "unexpected " #actual, (actual)))

/* The loaded library, and the providers that its nine factories returned. */

enum { classes = 5, associations = 3 };

static const char* const classNames[classes] = {"PowerManagementService", "PowerManagementCapabilities",
                                                "AssociatedPowerManagementService",
                                                "PowerManagementElementCapabilities", "PowerManagementHostedService"};
enum { service, capabilities, associatedService };

struct Providers {
    void* library;
    CMPIInstanceMI* instances[classes];
    CMPIAssociationMI* associations[associations];
    CMPIMethodMI* method;
};

static void* loadLibrary(int flags) {
    void* library = dlopen(libraryFile, flags);
    EXPECT_LOADED(library != NULL);
    return library;
}

/* The factory of a class, whose name is given without "TALVO_", for one kind of provider. */
static void* factory(void* library, const char* className, const char* kind) {
    char name[128];
    snprintf(name, sizeof name, "%sProvider_Create_%sMI", className, kind);
    void* found = dlsym(library, name);
    EXPECT_LOADED(found != NULL);
    return found;
}

typedef CMPIInstanceMI* InstanceFactory(const CMPIBroker*, const CMPIContext*, CMPIStatus*);
typedef CMPIAssociationMI* AssociationFactory(const CMPIBroker*, const CMPIContext*, CMPIStatus*);
typedef CMPIMethodMI* MethodFactory(const CMPIBroker*, const CMPIContext*, CMPIStatus*);

/* dlsym() returns functions as object pointers. POSIX permits their conversion, C does not: hence __extension__. */
static void callFactories(struct Providers* providers, const CMPIBroker* broker) {
    CMPIStatus status = {CMPI_RC_OK, NULL};
    for (int i = 0; i < classes; ++i) {
        InstanceFactory* const create =
            __extension__(InstanceFactory*) factory(providers->library, classNames[i], "Instance");
        providers->instances[i] = create(broker, NULL, &status);
        EXPECT(providers->instances[i] != NULL && status.rc == CMPI_RC_OK);
    }
    for (int i = 0; i < associations; ++i) {
        AssociationFactory* const create = __extension__(AssociationFactory*)
            factory(providers->library, classNames[associatedService + i], "Association");
        providers->associations[i] = create(broker, NULL, &status);
        EXPECT(providers->associations[i] != NULL && status.rc == CMPI_RC_OK);
    }
    MethodFactory* const create =
        __extension__(MethodFactory*) factory(providers->library, classNames[service], "Method");
    providers->method = create(broker, NULL, &status);
    EXPECT(providers->method != NULL && status.rc == CMPI_RC_OK);
}

static struct Providers load(int flags, const CMPIBroker* broker) {
    struct Providers providers = {.library = loadLibrary(flags)};
    callFactories(&providers, broker);
    return providers;
}

static void cleanUp(const struct Providers* providers, CMPIBoolean terminating) {
    for (int i = 0; i < classes; ++i) {
        EXPECT(providers->instances[i]->ft->cleanup(providers->instances[i], NULL, terminating).rc == CMPI_RC_OK);
    }
    for (int i = 0; i < associations; ++i) {
        EXPECT(providers->associations[i]->ft->cleanup(providers->associations[i], NULL, terminating).rc == CMPI_RC_OK);
    }
    EXPECT(providers->method->ft->cleanup(providers->method, NULL, terminating).rc == CMPI_RC_OK);
}

/* Unloads the library, and makes sure that it is gone. */
static void unload(struct Providers* providers) {
    EXPECT(dlclose(providers->library) == 0);
    EXPECT(dlopen(libraryFile, RTLD_NOW | RTLD_NOLOAD) == NULL);
    memset(providers, 0, sizeof *providers);
}

/* Requests */

/* The names of the instances of this test's simulated machine. */
#define SERVICE                                                                                                        \
    "//host.example/root/cimv2:TALVO_PowerManagementService( CreationClassName=\"TALVO_PowerManagementService\""       \
    " Name=\"PowerStateManagement_system\" SystemCreationClassName=\"TALVO_ComputerSystem\""                           \
    " SystemName=\"host.example\" )"
static const char oneService[] = SERVICE "\n";
static const char oneHostedService[] = "//host.example/root/cimv2:TALVO_PowerManagementHostedService("
                                       " Antecedent=///root/cimv2:TALVO_ComputerSystem( Name=\"host.example\" )"
                                       " Dependent=" SERVICE " )\n";

static CMPIObjectPath* classPath(const CMPIBroker* broker, const char* className) {
    char name[128];
    snprintf(name, sizeof name, "TALVO_%s", className);
    return CMNewObjectPath(broker, "root/cimv2", name, NULL);
}

/* Answers the up-call with the only computer system. */
static CMPIStatus oneComputerSystem(const CMPIBroker* broker, const CMPIContext* context, const CMPIObjectPath* path,
                                    CMPIResult* result) {
    (void)context;
    EXPECT_TEXT(CMGetCharPtr(CMGetClassName(path, NULL)), "TALVO_ComputerSystem");
    CMPIObjectPath* system = classPath(broker, "ComputerSystem");
    CMAddKey(system, "Name", "host.example", CMPI_chars);
    return CMReturnObjectPath(result, system);
}

/* The names of a provider's instances as text, which belongs to the current request. */
static const char* instanceNames(const struct Providers* providers, int provider, const CMPIBroker* broker) {
    CMPIInstanceMI* mi = providers->instances[provider];
    CMPIResult* result = newResult(broker);
    const CMPIStatus status =
        mi->ft->enumerateInstanceNames(mi, newContext(broker), result, classPath(broker, classNames[provider]));
    EXPECT(status.rc == CMPI_RC_OK);
    EXPECT(isClosed(result));
    return returnedText(result);
}

static void expectService(const struct Providers* providers, const CMPIBroker* broker) {
    beginRequest();
    EXPECT_TEXT(instanceNames(providers, service, broker), oneService);
    endRequest();
}

/* Calls every operation that reads, and the method. @return their results as one text, to be freed with free(). */
static char* everything(const struct Providers* providers, const CMPIBroker* broker) {
    char* text = NULL;
    size_t size = 0;
    FILE* all = open_memstream(&text, &size);
    for (int i = 0; i < classes; ++i) {
        beginRequest();
        CMPIInstanceMI* mi = providers->instances[i];
        CMPIResult* names = newResult(broker);
        CMPIResult* instances = newResult(broker);
        CMPIStatus status =
            mi->ft->enumerateInstanceNames(mi, newContext(broker), names, classPath(broker, classNames[i]));
        EXPECT(status.rc == CMPI_RC_OK);
        status = mi->ft->enumerateInstances(mi, newContext(broker), instances, classPath(broker, classNames[i]), NULL);
        EXPECT(status.rc == CMPI_RC_OK);
        EXPECT(returnedText(names)[0] != '\0' && returnedText(instances)[0] != '\0');
        fprintf(all, "%s%s", returnedText(names), returnedText(instances));

        size_t count = 0;
        CMPIObjectPath** paths = returnedPaths(names, &count);
        CMPIResult* one = newResult(broker);
        if (i == service || i == capabilities) {
            status = mi->ft->getInstance(mi, newContext(broker), one, paths[0], NULL);
            EXPECT(count == 1 && status.rc == CMPI_RC_OK);
            fprintf(all, "%s", returnedText(one));
        }
        for (int association = 0; i == service && association < associations; ++association) {
            CMPIAssociationMI* links = providers->associations[association];
            CMPIResult* found = newResult(broker);
            char name[128];
            snprintf(name, sizeof name, "TALVO_%s", classNames[associatedService + association]);
            status = links->ft->associatorNames(links, newContext(broker), found, paths[0], name, NULL, NULL, NULL);
            EXPECT(status.rc == CMPI_RC_OK);
            status = links->ft->references(links, newContext(broker), found, paths[0], NULL, NULL, NULL);
            EXPECT(status.rc == CMPI_RC_OK);
            fprintf(all, "%s", returnedText(found));
        }
        endRequest();
    }

    beginRequest();
    CMPIArgs* arguments = newArguments(broker);
    const CMPIValue element = {.ref = classPath(broker, "ComputerSystem")};
    const CMPIValue reboot = {.uint16 = 5};
    CMAddArg(arguments, "PowerState", &reboot, CMPI_uint16);
    CMAddArg(arguments, "ManagedElement", &element, CMPI_ref);
    CMPIResult* result = newResult(broker);
    const CMPIStatus status = providers->method->ft->invokeMethod(providers->method, newContext(broker), result,
                                                                  classPath(broker, classNames[service]),
                                                                  "RequestPowerStateChange", arguments, NULL);
    EXPECT(status.rc == CMPI_RC_OK);
    EXPECT(isClosed(result));
    EXPECT_TEXT(returnedText(result), "0\n");
    fprintf(all, "%s", returnedText(result));
    endRequest();
    fclose(all);
    return text;
}

/* Cases */

static void useWith(int flags) {
    const CMPIBroker* broker = newBroker(knownTables, oneComputerSystem, NULL);
    struct Providers providers = load(flags, broker);
    char* text = everything(&providers, broker);
    EXPECT(strstr(text, oneService) == text);
    EXPECT(strstr(text, oneHostedService) != NULL);
    free(text);
    cleanUp(&providers, 1);
    unload(&providers);
}

static void boundLazily(void) {
    useWith(RTLD_LAZY | RTLD_LOCAL);
}

/* RTLD_NOW binds every symbol at once, so a missing symbol would be an error here. */
static void boundEagerly(void) {
    useWith(RTLD_NOW | RTLD_LOCAL);
}

/* A library that was loaded before has functions of the same names. The provider library must call its own ones. */
static void besideNamesakes(void) {
    void* namesakes = dlopen(namesakesFile, RTLD_NOW | RTLD_GLOBAL);
    EXPECT_LOADED(namesakes != NULL);
    useWith(RTLD_NOW | RTLD_GLOBAL);
    const int* calls = dlsym(namesakes, "namesakeCalls");
    EXPECT(calls != NULL && *calls == 0);
    for (int i = 0; i < classes; ++i) {
        EXPECT(factory(namesakes, classNames[i], "Instance") == factory(RTLD_DEFAULT, classNames[i], "Instance"));
    }
}

static void unloadedAfterIdleTime(void) {
    const CMPIBroker* broker = newBroker(knownTables, NULL, NULL);
    for (CMPIBoolean terminating = 0; terminating <= 1; ++terminating) {
        struct Providers providers = load(RTLD_NOW | RTLD_LOCAL, broker);
        expectService(&providers, broker);
        cleanUp(&providers, terminating);
        /* A provider still answers a request that arrives after its cleanup. */
        expectService(&providers, broker);
        unload(&providers);
    }
}

/* The number of files that are mapped; other mappings depend on the allocator. */
static size_t mappings(void) {
    FILE* maps = fopen("/proc/self/maps", "r");
    EXPECT(maps != NULL);
    size_t files = 0;
    char line[4096];
    while (fgets(line, sizeof line, maps) != NULL) {
        files += strchr(line, '/') != NULL;
    }
    EXPECT(fclose(maps) == 0);
    return files;
}

static void loadedAThousandTimes(void) {
    enum { warmUp = 100, loads = 1000 };
    const CMPIBroker* broker = newBroker(knownTables, NULL, NULL);
    size_t allocated = 0;
    size_t mapped = 0;
    for (int i = 0; i <= loads; ++i) {
        if (i == warmUp) {
            mapped = mappings();
            allocated = mallinfo2().uordblks;
        }
        struct Providers providers = load(RTLD_NOW | RTLD_LOCAL, broker);
        expectService(&providers, broker);
        cleanUp(&providers, 0);
        unload(&providers);
    }
    /* If each load leaked, it would leak at least one block. A few blocks in all may stay with the allocator. */
    const size_t grown = mallinfo2().uordblks - allocated;
    EXPECT((ptrdiff_t)grown < (ptrdiff_t)((loads - warmUp) * sizeof(void*)));
    EXPECT(mappings() == mapped);
}

/* A factory returns the same record for every broker, and the operations use the broker of its last call. */
static void createdForTwoObjectManagers(void) {
    const CMPIBroker* brokers[] = {newBroker(knownTables, NULL, NULL), newBroker(knownTables, oneComputerSystem, NULL)};
    struct Providers first = load(RTLD_NOW | RTLD_LOCAL, brokers[0]);
    for (int i = 1; i <= 1000; ++i) {
        struct Providers again = {.library = first.library};
        callFactories(&again, brokers[i % 2]);
        EXPECT(memcmp(&again, &first, sizeof first) == 0);
        beginRequest();
        EXPECT_TEXT(instanceNames(&again, classes - 1, brokers[i % 2]), i % 2 == 1 ? oneHostedService : "");
        endRequest();
    }
    cleanUp(&first, 1);
    unload(&first);
}

struct Shared {
    void* library;
    const CMPIBroker* broker;
};

static void* createAndAsk(void* shared) {
    struct Providers providers = {.library = ((const struct Shared*)shared)->library};
    const CMPIBroker* broker = ((const struct Shared*)shared)->broker;
    for (int i = 0; i < 200; ++i) {
        callFactories(&providers, broker);
        expectService(&providers, broker);
    }
    return NULL;
}

static void createdBySeveralThreads(void) {
    pthread_t threads[8];
    const size_t count = sizeof threads / sizeof *threads;
    const CMPIBroker* broker = newBroker(knownTables, oneComputerSystem, NULL);
    struct Providers providers = load(RTLD_NOW | RTLD_LOCAL, broker);
    struct Shared shared = {providers.library, broker};
    for (size_t i = 0; i < count; ++i) {
        EXPECT(pthread_create(&threads[i], NULL, createAndAsk, &shared) == 0);
    }
    for (size_t i = 0; i < count; ++i) {
        EXPECT(pthread_join(threads[i], NULL) == 0);
    }
    cleanUp(&providers, 1);
    unload(&providers);
}

static struct Providers askedAgain;

/* Serves the up-call with the library's own services, after it has called a second provider of the library, whose
   up-call it serves, too. */
static CMPIStatus servicesOfTheLibrary(const CMPIBroker* broker, const CMPIContext* context, const CMPIObjectPath* path,
                                       CMPIResult* result) {
    static int depth;
    if (depth == 0) {
        ++depth;
        EXPECT_TEXT(CMGetCharPtr(CMGetClassName(path, NULL)), "TALVO_ComputerSystem");
        EXPECT(strstr(instanceNames(&askedAgain, associatedService, broker), "UserOfService=" SERVICE) != NULL);
        --depth;
    }
    CMPIInstanceMI* mi = askedAgain.instances[service];
    return mi->ft->enumerateInstanceNames(mi, context, result, classPath(broker, classNames[service]));
}

static void calledBackIntoItself(void) {
    const CMPIBroker* broker = newBroker(knownTables, servicesOfTheLibrary, NULL);
    askedAgain = load(RTLD_NOW | RTLD_LOCAL, broker);
    beginRequest();
    const char* text = instanceNames(&askedAgain, classes - 1, broker);
    EXPECT(strstr(text, "Antecedent=" SERVICE) != NULL);
    EXPECT(strstr(text, "Dependent=" SERVICE) != NULL);
    endRequest();
    cleanUp(&askedAgain, 1);
    unload(&askedAgain);
}

static void servedByALaterObjectManager(void) {
    const CMPIBroker* known = newBroker(knownTables, oneComputerSystem, NULL);
    const CMPIBroker* later = newBroker(longerTables, oneComputerSystem, NULL);
    struct Providers providers = load(RTLD_NOW | RTLD_LOCAL, known);
    free(everything(&providers, known)); /* this reboots the simulated machine */
    char* expected = everything(&providers, known);
    callFactories(&providers, later);
    char* text = everything(&providers, later);
    EXPECT_TEXT(text, expected);
    free(text);
    free(expected);
    cleanUp(&providers, 1);
    unload(&providers);
}

static const struct {
    const char* name;
    void (*run)(void);
} cases[] = {
    {"bound-lazily", boundLazily},
    {"bound-eagerly", boundEagerly},
    {"beside-namesakes", besideNamesakes},
    {"unloaded-after-idle-time", unloadedAfterIdleTime},
    {"loaded-a-thousand-times", loadedAThousandTimes},
    {"created-for-two-object-managers", createdForTwoObjectManagers},
    {"created-by-several-threads", createdBySeveralThreads},
    {"called-back-into-itself", calledBackIntoItself},
    {"served-by-a-later-object-manager", servedByALaterObjectManager},
};

/* A simulated machine for this process only: its configuration and state are in a temporary folder. */
static char folder[] = "/tmp/provider_host.XXXXXX";
static char configurationFile[sizeof folder + 16];

static void makeMachine(void) {
    if (mkdtemp(folder) == NULL) {
        perror(folder);
        exit(EXIT_FAILURE);
    }
    snprintf(configurationFile, sizeof configurationFile, "%s/agent.toml", folder);
    FILE* configuration = fopen(configurationFile, "w");
    if (configuration == NULL) {
        perror(configurationFile);
        exit(EXIT_FAILURE);
    }
    fprintf(configuration,
            "[system]\nname = \"host.example\"\n"
            "[instrumentation.simulated]\nstate-file = \"%s/machine.json\"\nreboot-time = 3600\n",
            folder);
    EXPECT(fclose(configuration) == 0);
    EXPECT(setenv("ORV_AGENT_CONFIG", configurationFile, 1) == 0);
}

static void removeMachine(void) {
    static const char* const files[] = {"agent.toml", "machine.json", "machine.json.lock"};
    for (size_t i = 0; i < sizeof files / sizeof *files; ++i) {
        char file[sizeof folder + 32];
        snprintf(file, sizeof file, "%s/%s", folder, files[i]);
        unlink(file);
    }
    if (rmdir(folder) != 0) {
        perror(folder);
    }
}

int main(int argc, char* argv[]) {
    if (argc == 4) {
        libraryFile = argv[1];
        namesakesFile = argv[2];
        for (size_t i = 0; i < sizeof cases / sizeof *cases; ++i) {
            if (strcmp(argv[3], cases[i].name) == 0) {
                makeMachine();
                atexit(removeMachine);
                cases[i].run();
                return EXIT_SUCCESS;
            }
        }
    }
    fprintf(stderr, "usage: provider_host LIBRARY NAMESAKES CASE\n");
    return 2;
}
