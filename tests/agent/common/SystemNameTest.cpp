#include "Norv/Common.h"

#include "TestSupport.h"

#include <gtest/gtest.h>

#include <array>
#include <atomic>
#include <cerrno>
#include <cstdlib>
#include <cstring>
#include <string>
#include <thread>
#include <vector>

#include <netdb.h>
#include <sys/wait.h>
#include <unistd.h>

namespace {

/** What gethostname and the name service tell about the host's name. */
struct Host {
    /** Null if gethostname fails. */
    const char* name;
    /** The fully qualified name in the hosts file or name service; null if they do not know the host. */
    const char* canonicalName = nullptr;
};

Host host;
std::atomic<int> lookups = 0;

} // namespace

// These replace the C library's functions in this program.
extern "C" {

int gethostname(char* name, size_t size) noexcept {
    if (host.name == nullptr) {
        errno = EFAULT;
        return -1;
    }
    std::strncpy(name, host.name, size);
    return 0;
}

int getaddrinfo(const char* node, const char* /*service*/, const addrinfo* hints, addrinfo** found) {
    ++lookups;
    if (host.canonicalName == nullptr || std::strcmp(node, host.name) != 0 || (hints->ai_flags & AI_CANONNAME) == 0) {
        return EAI_NONAME;
    }
    *found = new addrinfo{};
    (*found)->ai_canonname = strdup(host.canonicalName);
    return 0;
}

void freeaddrinfo(addrinfo* found) noexcept {
    free(found->ai_canonname);
    delete found;
}
}

namespace {

using AgentTest::TemporaryFolder;

/**
 * The system's name in a new process, which asks for it from four threads at once, and once more after the host was
 * renamed. "different names" if the answers differ.
 */
std::string systemName(const Host& ofHost, const std::string& configuration) {
    const TemporaryFolder folder;
    AgentTest::writeFile(folder / "agent.toml", configuration);
    std::array<int, 2> pipe{};
    if (::pipe(pipe.data()) != 0) {
        return "no pipe";
    }
    const pid_t child = fork();
    if (child == 0) {
        host = ofHost;
        setenv("ORV_AGENT_CONFIG", (folder / "agent.toml").c_str(), 1);
        std::array<std::string, 4> names;
        std::vector<std::thread> threads;
        for (std::string& name : names) {
            threads.emplace_back([&name] { name = Norv::getSystemName(); });
        }
        for (std::thread& thread : threads) {
            thread.join();
        }
        host = {"renamed.example.org"};
        std::string result = Norv::getSystemName();
        for (const std::string& name : names) {
            result = name == result ? result : "different names";
        }
        result = lookups > 1 ? "looked up more than once" : result;
        const bool written = write(pipe[1], result.data(), result.size()) == static_cast<ssize_t>(result.size());
        _exit(written ? 0 : 1);
    }
    close(pipe[1]);
    std::array<char, 1024> name{};
    const ssize_t size = read(pipe[0], name.data(), name.size());
    close(pipe[0]);
    waitpid(child, nullptr, 0);
    return {name.data(), static_cast<std::size_t>(size)};
}

struct Case {
    const char* test;
    Host host;
    const char* configuration;
    const char* expected;
};

class SystemName : public testing::TestWithParam<Case> {};

TEST_P(SystemName, IsTheSameForTheLifeOfAProcess) {
    EXPECT_EQ(systemName(GetParam().host, GetParam().configuration), GetParam().expected);
}

const char* const configured = "[system]\nname = \"managed.example.org\"\n";

INSTANTIATE_TEST_SUITE_P(
    All, SystemName,
    testing::Values(Case{"Configured", {"box.example.org"}, configured, "managed.example.org"},
                    Case{"HostNameWithADot", {"box.example.org", "other.example.org"}, "", "box.example.org"},
                    Case{"CanonicalName", {"box", "box.example.org"}, "", "box.example.org"},
                    Case{"CanonicalNameWithoutADot", {"box", "localhost"}, "", "box"},
                    Case{"NoCanonicalName", {"box"}, "", "box"}, Case{"NoHostName", {nullptr}, "", "localhost"},
                    Case{"EmptyHostName", {""}, "", "localhost"},
                    Case{"WrongConfiguration", {"box", "box.example.org"}, "[system]\nname = 5\n", "box.example.org"}),
    [](const auto& each) { return each.param.test; });

} // namespace
