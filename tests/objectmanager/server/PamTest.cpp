/* Log-ins against users of PAM's that the test makes, by names that every Debian system has. */
#include "agent/TestSupport.h"
#include "server/PamAuthenticator.h"

#include <gmock/gmock.h>

#include <chrono>

/** PAM itself leaks a few bytes if a service is not configured. LeakSanitizer calls this function by its name. */
extern "C" const char* __lsan_default_suppressions();
extern "C" const char* __lsan_default_suppressions() {
    return "leak:libpam.so";
}

namespace ServerTest {
namespace {

using namespace ObjectManager;

class PamTest : public testing::Test {
protected:
    PamTest() {
        AgentTest::writeFile(_folder / "users", "root:top:orvcim\n"
                                                "daemon:deep:orvcim\n"
                                                "nobody:small:orvcim\n"
                                                "visitor:hello:orvcim\n"
                                                "elsewhere:secret:sshd\n");
        service("");
        _settings.folder = _folder / "";
        _settings.allowRoot = true;
        _settings.allowWithoutShell = true;
    }

    /** Writes the service file. @param first a line before the others. */
    void service(const std::string& first, const std::string& options = "") {
        const std::string module = std::string(TEST_PAM_MATRIX) + " passdb=" + (_folder / "users").string() + options;
        AgentTest::writeFile(_folder / "orvcim",
                             first + "auth required " + module + "\naccount required " + module + "\n");
    }

    Server::LogIn logIn(const std::string& user, const std::string& password) const {
        return Server::PamAuthenticator(_settings).logIn(user, password, "192.0.2.1");
    }

    AgentTest::TemporaryFolder _folder;
    Server::PamSettings _settings;
};

TEST_F(PamTest, LetsInWhoHasThePassword) {
    const Server::LogIn result = logIn("nobody", "small");
    ASSERT_TRUE(result.caller);
    EXPECT_EQ(result.caller->user, "nobody");
}

TEST_F(PamTest, SaysWhyItLetsNobodyElseIn) {
    const std::pair<const char*, const char*> wrong[] = {
        {"nobody", "large"}, {"nobody", ""}, {"nobody", "small "}, {"stranger", "small"}, {"", ""}};
    for (const auto& [user, password] : wrong) {
        const Server::LogIn result = logIn(user, password);
        EXPECT_FALSE(result.caller) << user << ' ' << password;
        EXPECT_NE(result.problem, "") << user << ' ' << password;
    }
    EXPECT_EQ(logIn("nobody", "large").problem, "Authentication failure");
}

TEST_F(PamTest, AsksWhetherTheUserMayUseTheService) {
    const Server::LogIn result = logIn("elsewhere", "secret");
    EXPECT_FALSE(result.caller);
    EXPECT_EQ(result.problem, "Permission denied");
}

TEST_F(PamTest, LetsNobodyInWhereTheServiceIsNotConfigured) {
    _settings.service = "nothing";
    EXPECT_FALSE(logIn("nobody", "small").caller);
    _settings.folder = "/nowhere";
    EXPECT_FALSE(logIn("nobody", "small").caller);
}

TEST_F(PamTest, LetsNobodyInWherePamAsksForMoreThanAPassword) {
    service("", " echo");
    EXPECT_FALSE(logIn("nobody", "small").caller);
}

TEST_F(PamTest, DoesNotMindWhatPamSays) {
    service("", " verbose");
    EXPECT_TRUE(logIn("nobody", "small").caller);
    EXPECT_FALSE(logIn("nobody", "large").caller);
}

TEST_F(PamTest, DoesNotSleepAfterAFailure) {
    service("auth optional pam_faildelay.so delay=60000000\n");
    const auto begin = std::chrono::steady_clock::now();
    EXPECT_FALSE(logIn("nobody", "large").caller);
    EXPECT_LT(std::chrono::steady_clock::now() - begin, std::chrono::seconds{20});
}

struct Roles {
    const char* readGroup;
    const char* powerGroup;
    const char* user;
    const char* password;
    bool mayRead;
    bool mayChangePower;
};

TEST_F(PamTest, TakesRolesFromGroups) {
    const Roles cases[] = {
        {"", "orv-power-that-is-not", "nobody", "small", true, false},
        {"", "orv-power-that-is-not", "root", "top", true, true},
        {"", "orv-power-that-is-not", "visitor", "hello", true, false},
        {"", "nogroup", "nobody", "small", true, true},
        {"", "nogroup", "daemon", "deep", true, false},
        {"daemon", "nogroup", "daemon", "deep", true, false},
        {"daemon", "nogroup", "nobody", "small", true, true},
        {"daemon", "bin", "nobody", "small", false, false},
        {"daemon", "bin", "visitor", "hello", false, false},
        {"orv-read-that-is-not", "bin", "daemon", "deep", false, false},
    };
    for (const Roles& each : cases) {
        _settings.readGroup = each.readGroup;
        _settings.powerGroup = each.powerGroup;
        const Server::LogIn result = logIn(each.user, each.password);
        ASSERT_TRUE(result.caller) << each.user;
        EXPECT_EQ(result.caller->mayRead, each.mayRead) << each.user << ' ' << each.readGroup << ' ' << each.powerGroup;
        EXPECT_EQ(result.caller->mayChangePower, each.mayChangePower)
            << each.user << ' ' << each.readGroup << ' ' << each.powerGroup;
    }
}

TEST_F(PamTest, LetsRootInOnlyWhereItIsToldTo) {
    EXPECT_TRUE(logIn("root", "top").caller);
    _settings.allowRoot = false;
    EXPECT_EQ(logIn("root", "top").problem, "root may not log in (see --allow-root)");
    EXPECT_EQ(logIn("root", "wrong").problem, "Authentication failure");
}

TEST_F(PamTest, LetsUsersWithoutALogInShellInOnlyWhereItIsToldTo) {
    _settings.allowWithoutShell = false;
    // One whose shell lets nobody in, and one who has none, since the system does not know him.
    for (const auto& [user, password] : {std::pair("nobody", "small"), std::pair("visitor", "hello")}) {
        EXPECT_EQ(logIn(user, password).problem, "the user has no log-in shell (see --allow-without-shell)") << user;
    }
    EXPECT_TRUE(logIn("root", "top").caller);
}

TEST(GroupTest, ExistsOrNot) {
    EXPECT_TRUE(Server::groupExists("daemon"));
    EXPECT_FALSE(Server::groupExists("orv-power-that-is-not"));
    EXPECT_FALSE(Server::groupExists(""));
}

} // namespace
} // namespace ServerTest
