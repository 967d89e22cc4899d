/**
 * Tests operations while memory is short: each allocation of an operation fails in turn, first alone and then with all
 * later allocations. The operation must end as expected, and the host must go on.
 *
 * The host's own allocations never fail. Neither do those of the loader: it allocates a library's thread-local
 * variables when a thread uses them first, and ends the process if it cannot.
 */
#include "broker.h"

#include "agent/PassingTime.h"
#include "agent/TestSupport.h"

#include "cmpimacs.h"

#include <gtest/gtest.h>

#include <cerrno>
#include <cstddef>
#include <cstdint>
#include <exception>
#include <functional>
#include <new>
#include <string>
#include <vector>

#include <dlfcn.h>
#include <fcntl.h>
#include <sys/auxv.h>
#include <sys/mman.h>
#include <sys/stat.h>
#include <sys/wait.h>
#include <unistd.h>

extern "C" {
void* __libc_malloc(std::size_t size);
void* __libc_calloc(std::size_t count, std::size_t size);
void* __libc_realloc(void* memory, std::size_t size);
void* __libc_memalign(std::size_t alignment, std::size_t size);

extern const char __executable_start;
extern const char etext;
}

namespace {

/** Which allocations of this thread fail. */
struct Shortage {
    bool counting = false;
    unsigned int allocations = 0;
    /** The number of the allocation that fails; 0 if none fails. */
    unsigned int first = 0;
    bool allThatFollow = false;
};

constinit thread_local Shortage shortage;

bool isLoaders(const void* caller) {
    Dl_info found{};
    return dladdr(caller, &found) != 0 && reinterpret_cast<std::uintptr_t>(found.dli_fbase) == getauxval(AT_BASE);
}

/** Counts an allocation. @return whether it has to fail. @param caller the address in the code that allocates. */
bool fails(const void* caller) {
    const auto address = reinterpret_cast<std::uintptr_t>(caller);
    const bool isHost = address >= reinterpret_cast<std::uintptr_t>(&__executable_start) &&
                        address < reinterpret_cast<std::uintptr_t>(&etext);
    if (!shortage.counting || isHost || isLoaders(caller)) {
        return false;
    }
    const unsigned int number = ++shortage.allocations;
    const bool failing =
        shortage.first != 0 && (number == shortage.first || (shortage.allThatFollow && number > shortage.first));
    if (failing) {
        errno = ENOMEM;
    }
    return failing;
}

} // namespace

/* The allocator of the whole process. */
extern "C" {

void* malloc(std::size_t size) {
    return fails(__builtin_return_address(0)) ? nullptr : __libc_malloc(size);
}

void* calloc(std::size_t count, std::size_t size) {
    return fails(__builtin_return_address(0)) ? nullptr : __libc_calloc(count, size);
}

void* realloc(void* memory, std::size_t size) {
    return fails(__builtin_return_address(0)) ? nullptr : __libc_realloc(memory, size);
}

void* aligned_alloc(std::size_t alignment, std::size_t size) {
    return fails(__builtin_return_address(0)) ? nullptr : __libc_memalign(alignment, size);
}
}

namespace {

CMPIInstanceMI* computerSystem = nullptr;

CMPIStatus computerSystemNames(const CMPIBroker*, const CMPIContext* context, const CMPIObjectPath* path,
                               CMPIResult* result) {
    return computerSystem->ft->enumerateInstanceNames(computerSystem, context, result, path);
}

CMPIStatus computerSystems(const CMPIBroker*, const CMPIContext* context, const CMPIObjectPath* path,
                           CMPIResult* result) {
    return computerSystem->ft->enumerateInstances(computerSystem, context, result, path, nullptr);
}

/** The provider libraries in this process, and the broker that they use. */
class Host {
public:
    static const Host& instance() {
        static const Host host;
        return host;
    }

    const CMPIBroker* broker = newBroker(knownTables, computerSystemNames, computerSystems);

    template <typename MI>
    MI* provider(const std::string& name, const std::string& kind) const {
        return create<MI>(_provider, name, kind);
    }

    CMPIObjectPath* path(const std::string& className) const {
        return CMNewObjectPath(broker, "root/cimv2", ("TALVO_" + className).c_str(), nullptr);
    }

private:
    Host() { computerSystem = create<CMPIInstanceMI>(load(ORV_COMPUTERSYSTEM_LIBRARY), "ComputerSystem", "Instance"); }

    static void* load(const char* file) {
        void* const library = dlopen(file, RTLD_NOW);
        if (library == nullptr) {
            throw std::runtime_error(dlerror());
        }
        return library;
    }

    template <typename MI>
    MI* create(void* library, const std::string& name, const std::string& kind) const {
        const std::string factory = name + "Provider_Create_" + kind + "MI";
        using Create = MI*(const CMPIBroker*, const CMPIContext*, CMPIStatus*);
        auto* const create = reinterpret_cast<Create*>(dlsym(library, factory.c_str()));
        if (create == nullptr) {
            throw std::runtime_error(dlerror());
        }
        return create(broker, nullptr, nullptr);
    }

    void* _provider = load(ORV_PROVIDER_LIBRARY);
};

/** One request. It makes everything that the operation needs before the call, so that only the call lacks memory. */
using Call = std::function<CMPIStatus()>;
using Request = std::function<Call(CMPIResult* result)>;

struct Operation {
    std::string name;
    Request request;
    /** Whether the operation closes its result when it succeeds. */
    bool closes = true;
    /** Whether the returned objects contain the host's name. */
    bool namesTheHost = false;
};

/** The outcome of a request. */
struct Outcome {
    bool threw = false;
    /** Whether the power state of the machine was changed. */
    bool moved = false;
    CMPIrc code = CMPI_RC_OK;
    bool closed = false;
    std::string text;
    unsigned int allocations = 0;
};

const char* stateFile = nullptr;

/** The time in nanoseconds when the power state of the machine was changed last; 0 if it was never changed. */
std::int64_t lastMove() {
    struct stat status {};
    return stat(stateFile, &status) != 0 ? 0
                                         : std::int64_t{status.st_mtim.tv_sec} * 1'000'000'000 + status.st_mtim.tv_nsec;
}

Outcome run(const Operation& operation, unsigned int failing, bool allThatFollow) {
    beginRequest();
    Outcome outcome;
    const std::int64_t before = lastMove();
    CMPIResult* const result = newResult(Host::instance().broker);
    const Call call = operation.request(result);
    shortage = {.counting = true, .first = failing, .allThatFollow = allThatFollow};
    try {
        outcome.code = call().rc;
    } catch (const std::exception&) {
        outcome.threw = true;
    }
    shortage.counting = false;
    outcome.allocations = shortage.allocations;
    outcome.moved = lastMove() != before;
    outcome.closed = isClosed(result) != 0;
    outcome.text = returnedText(result);
    endRequest();
    return outcome;
}

/**
 * The text that was written to standard error since the last call. From the first call on, standard error is a file.
 */
class StandardError {
public:
    explicit StandardError(const std::string& file) : _file(open(file.c_str(), O_RDWR | O_CREAT | O_APPEND, 0600)) {
        dup2(_file, STDERR_FILENO);
        _read = lseek(_file, 0, SEEK_END);
    }

    std::string text() {
        std::string text;
        char chunk[4096];
        for (ssize_t size = 0; (size = pread(_file, chunk, sizeof chunk, _read)) > 0; _read += size) {
            text.append(chunk, static_cast<std::size_t>(size));
        }
        return text;
    }

private:
    int _file;
    off_t _read = 0;
};

/** The allocation that fails now, and the problem that was found, in memory that the parent process shares. */
struct Progress {
    unsigned int failing;
    bool allThatFollow;
    unsigned int allocations;
    /** The problem; empty if there was none. */
    char complaint[4096];
};

void complain(Progress& progress, const std::string& text) {
    text.copy(progress.complaint, sizeof progress.complaint - 1);
    _exit(EXIT_FAILURE);
}

/** Ends the process if the outcome of an operation does not agree with `reported`, the text on standard error. */
void requireOutcome(const Outcome& outcome, const Outcome& usual, const std::string& reported, Progress& progress) {
    const bool failed = outcome.threw || outcome.code != CMPI_RC_OK || outcome.closed != usual.closed;
    // A success with another text than usual is right only if a record tells what the provider could not read. A
    // shortage that does not change the answer, such as one in the log, needs no record.
    if (!failed && outcome.text != usual.text && reported.find("bad_alloc") == std::string::npos &&
        reported.find(" log 6000 ") == std::string::npos) {
        complain(progress, "the operation succeeded and returned\n" + outcome.text + "instead of\n" + usual.text +
                               "and reported only: " + reported);
    }
    if (outcome.moved != (reported.find("Power request accepted") != std::string::npos)) {
        complain(progress, (outcome.moved ? "the machine was switched" : "the machine was not switched") +
                               std::string(", and this was reported: ") + reported);
    }
}

/** Ends the process if an operation that had enough memory has another outcome than the usual one. */
void requireUsualOutcome(const Outcome& outcome, const Outcome& usual, Progress& progress) {
    if (outcome.threw || outcome.code != CMPI_RC_OK || outcome.closed != usual.closed || outcome.text != usual.text) {
        complain(progress, "the next operation returned\n" + outcome.text + "instead of\n" + usual.text);
    }
}

/** Lets each allocation of an operation fail in turn. Ends the process, at the first wrong outcome with a failure. */
void failEachAllocation(const Operation& operation, Progress& progress, const std::string& errors) {
    const Outcome usual = (run(operation, 0, false), run(operation, 0, false));
    if (usual.threw || usual.code != CMPI_RC_OK || usual.text.empty() || usual.closed != operation.closes) {
        complain(progress, "the operation does not do with enough memory what it should: " + usual.text);
    }
    StandardError standardError(errors);
    for (const bool allThatFollow : {false, true}) {
        progress.allThatFollow = allThatFollow;
        for (progress.failing = 1;; ++progress.failing) {
            standardError.text();
            const Outcome outcome = run(operation, progress.failing, allThatFollow);
            if (outcome.allocations < progress.failing) {
                break;
            }
            progress.allocations = progress.failing;
            requireOutcome(outcome, usual, standardError.text(), progress);
            requireUsualOutcome(run(operation, 0, false), usual, progress);
        }
    }
    _exit(EXIT_SUCCESS);
}

class MemoryShortage : public testing::TestWithParam<Operation> {
protected:
    MemoryShortage() {
        stateFile = machine.c_str();
        configure(6000);
        setenv("ORV_AGENT_CONFIG", (folder / "agent.toml").c_str(), 1);
    }

    /** @param level below which records are not logged. */
    void configure(int level) const {
        AgentTest::writeFile(folder / "agent.toml",
                             "[system]\nname = \"host.example\"\n[log]\nlevel = " + std::to_string(level) +
                                 "\n[instrumentation.simulated]\nstate-file = \"" + machine +
                                 "\"\nreboot-time = 0.0\nshutdown-time = 0\n");
    }

    /** Runs a function, which ends the process, in a process of its own. */
    template <typename Function>
    void inHost(Function function) {
        const pid_t host = fork();
        ASSERT_GE(host, 0);
        if (host == 0) {
            function();
        }
        int status = 0;
        ASSERT_EQ(waitpid(host, &status, 0), host);
        const std::string place = "allocation " + std::to_string(progress.failing) +
                                  (progress.allThatFollow ? " and all that follow" : "") + " failed";
        EXPECT_TRUE(WIFEXITED(status)) << place << ", and the host ended by signal " << WTERMSIG(status);
        EXPECT_EQ(WEXITSTATUS(status), EXIT_SUCCESS) << place << ": " << progress.complaint;
    }

    AgentTest::TemporaryFolder folder;
    const std::string machine = (folder / "machine.json").string();
    const std::string errors = (folder / "errors").string();
    Progress& progress = *static_cast<Progress*>(
        mmap(nullptr, sizeof(Progress), PROT_READ | PROT_WRITE, MAP_SHARED | MAP_ANONYMOUS, -1, 0));
};

TEST_P(MemoryShortage, EndsTheOperationAndNotTheHost) {
    inHost([this] { failEachAllocation(GetParam(), progress, errors); });
    EXPECT_GT(progress.allocations, 0U);
}

/** Operations that are the first in their process, or that notice that the configuration has changed. */
class ConfigurationInMemoryShortage : public MemoryShortage {};

TEST_P(ConfigurationInMemoryShortage, EndsTheFirstOperationAndNotTheHost) {
    for (const bool allThatFollow : {false, true}) {
        progress.allThatFollow = allThatFollow;
        progress.allocations = 1;
        for (progress.failing = 1; progress.failing <= progress.allocations; ++progress.failing) {
            ASSERT_NO_FATAL_FAILURE(inHost([&] {
                StandardError standardError(errors);
                const Outcome first = run(GetParam(), progress.failing, allThatFollow);
                progress.allocations = first.allocations;
                const std::string reported = standardError.text();
                const Outcome usual = run(GetParam(), 0, false);
                requireOutcome(first, usual, reported, progress);
                const bool isWhole = usual.code == CMPI_RC_OK && usual.closed == GetParam().closes &&
                                     usual.text.find("host.example") != std::string::npos;
                if (GetParam().namesTheHost && !isWhole) {
                    complain(progress, "the next operation returned\n" + usual.text);
                }
                _exit(EXIT_SUCCESS);
            }));
            if (HasFailure()) {
                return;
            }
        }
        EXPECT_GT(progress.failing, 50U);
    }
}

TEST_P(ConfigurationInMemoryShortage, IsLookedAtAgainWhereAChangeCouldNotBeRead) {
    inHost([&] {
        const Outcome usual = (run(GetParam(), 0, false), run(GetParam(), 0, false));
        StandardError standardError(errors);
        int level = 6000;
        for (const bool allThatFollow : {false, true}) {
            progress.allThatFollow = allThatFollow;
            for (progress.failing = 1;; ++progress.failing) {
                level = level == 6000 ? 6500 : 6000;
                configure(level);
                AgentTest::passTime(std::chrono::seconds(2));
                const Outcome outcome = run(GetParam(), progress.failing, allThatFollow);
                std::string reported = standardError.text();
                requireOutcome(outcome, usual, reported, progress);
                AgentTest::passTime(std::chrono::seconds(2));
                requireUsualOutcome(run(GetParam(), 0, false), usual, progress);
                reported += standardError.text();
                if (reported.find("its thresholds apply from now on") == std::string::npos) {
                    complain(progress, "the change was not noticed: " + reported);
                }
                if (outcome.allocations < progress.failing) {
                    break;
                }
                progress.allocations = progress.failing;
            }
        }
        _exit(EXIT_SUCCESS);
    });
    EXPECT_GT(progress.allocations, 50U);
}

/* The operations */

const char* const classes[] = {"PowerManagementService", "PowerManagementCapabilities",
                               "AssociatedPowerManagementService", "PowerManagementElementCapabilities",
                               "PowerManagementHostedService"};

CMPIInstanceMI* instanceProvider(const std::string& className) {
    const Host& host = Host::instance();
    return className == "ComputerSystem" ? computerSystem : host.provider<CMPIInstanceMI>(className, "Instance");
}

/** The path of a class's first instance. */
CMPIObjectPath* firstOf(const std::string& className) {
    const Host& host = Host::instance();
    CMPIInstanceMI* const mi = instanceProvider(className);
    CMPIResult* const names = newResult(host.broker);
    mi->ft->enumerateInstanceNames(mi, newContext(host.broker), names, host.path(className));
    std::size_t count = 0;
    CMPIObjectPath** const paths = returnedPaths(names, &count);
    return count == 0 ? nullptr : paths[0];
}

void addInstanceOperations(std::vector<Operation>& operations, const std::string& className) {
    const auto enumerated = [className](auto member) -> Request {
        return [=](CMPIResult* result) -> Call {
            const Host& host = Host::instance();
            CMPIInstanceMI* const mi = instanceProvider(className);
            const CMPIContext* const context = newContext(host.broker);
            const CMPIObjectPath* const path = host.path(className);
            return [=] { return member(mi, context, result, path); };
        };
    };
    operations.push_back({className + "_EnumInstanceNames", enumerated([](auto* mi, auto... arguments) {
                              return mi->ft->enumerateInstanceNames(mi, arguments...);
                          })});
    operations.push_back({className + "_EnumInstances", enumerated([](auto* mi, auto... arguments) {
                              return mi->ft->enumerateInstances(mi, arguments..., nullptr);
                          })});
    operations.push_back({className + "_GetInstance", [className](CMPIResult* result) -> Call {
                              CMPIInstanceMI* const mi = instanceProvider(className);
                              const CMPIContext* const context = newContext(Host::instance().broker);
                              const CMPIObjectPath* const path = firstOf(className);
                              return [=] { return mi->ft->getInstance(mi, context, result, path, nullptr); };
                          }});
}

void addTraversals(std::vector<Operation>& operations, const std::string& className, const std::string& source) {
    const auto traversal = [=](auto call) -> Request {
        return [=](CMPIResult* result) -> Call {
            const Host& host = Host::instance();
            auto* const mi = host.provider<CMPIAssociationMI>(className, "Association");
            const CMPIContext* const context = newContext(host.broker);
            const CMPIObjectPath* const path = firstOf(source);
            return [=] { return call(mi, context, result, path); };
        };
    };
    const std::string from = "_from_" + source;
    operations.push_back({className + "_AssociatorNames" + from, traversal([](auto* mi, auto... arguments) {
                              return mi->ft->associatorNames(mi, arguments..., nullptr, nullptr, nullptr, nullptr);
                          }),
                          false});
    operations.push_back({className + "_Associators" + from, traversal([](auto* mi, auto... arguments) {
                              return mi->ft->associators(mi, arguments..., nullptr, nullptr, nullptr, nullptr, nullptr);
                          }),
                          false});
    operations.push_back({className + "_ReferenceNames" + from, traversal([](auto* mi, auto... arguments) {
                              return mi->ft->referenceNames(mi, arguments..., nullptr, nullptr);
                          }),
                          false});
    operations.push_back({className + "_References" + from, traversal([](auto* mi, auto... arguments) {
                              return mi->ft->references(mi, arguments..., nullptr, nullptr, nullptr);
                          }),
                          false});
}

Operation powerRequest(const std::string& name, CMPIUint16 state) {
    return {name, [state](CMPIResult* result) -> Call {
                const Host& host = Host::instance();
                auto* const mi = host.provider<CMPIMethodMI>("PowerManagementService", "Method");
                const CMPIContext* const context = newContext(host.broker);
                const CMPIObjectPath* const path = firstOf("PowerManagementService");
                CMPIArgs* const arguments = newArguments(host.broker);
                const CMPIValue powerState = {.uint16 = state};
                const CMPIValue element = {.ref = firstOf("ComputerSystem")};
                CMAddArg(arguments, "PowerState", &powerState, CMPI_uint16);
                CMAddArg(arguments, "ManagedElement", &element, CMPI_ref);
                return [=] {
                    return mi->ft->invokeMethod(mi, context, result, path, "RequestPowerStateChange", arguments,
                                                nullptr);
                };
            }};
}

std::vector<Operation> operations() {
    std::vector<Operation> operations;
    for (const char* className : classes) {
        addInstanceOperations(operations, className);
    }
    addInstanceOperations(operations, "ComputerSystem");
    for (const char* className : {"AssociatedPowerManagementService", "PowerManagementHostedService"}) {
        addTraversals(operations, className, "PowerManagementService");
        addTraversals(operations, className, "ComputerSystem");
    }
    addTraversals(operations, "PowerManagementElementCapabilities", "PowerManagementService");
    addTraversals(operations, "PowerManagementElementCapabilities", "PowerManagementCapabilities");
    operations.push_back(powerRequest("Reboot", 5));
    operations.push_back(powerRequest("Shutdown", 8));
    return operations;
}

INSTANTIATE_TEST_SUITE_P(Of, MemoryShortage, testing::ValuesIn(operations()),
                         [](const auto& test) { return test.param.name; });

std::vector<Operation> operationsThatReadTheConfiguration() {
    std::vector<Operation> chosen;
    addInstanceOperations(chosen, "PowerManagementService");
    chosen.resize(1);
    chosen.front().namesTheHost = true;
    chosen.push_back(powerRequest("Reboot", 5));
    return chosen;
}

INSTANTIATE_TEST_SUITE_P(Of, ConfigurationInMemoryShortage, testing::ValuesIn(operationsThatReadTheConfiguration()),
                         [](const auto& test) { return test.param.name; });

} // namespace
