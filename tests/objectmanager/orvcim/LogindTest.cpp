#include "PrivateBus.h"
#include "Provided.h"

#include <gmock/gmock.h>

#include <regex>

#include <unistd.h>

namespace OrvcimTest {
namespace {

using AgentTest::PrivateBus;
using testing::AllOf;
using testing::ElementsAre;
using testing::EndsWith;
using testing::HasSubstr;
using testing::IsEmpty;
using testing::MatchesRegex;
using testing::Not;
using testing::StartsWith;

// Even if a test forgets to set a bus, nothing here reaches the machine's own bus.
const bool systemBusIsForgotten = (AgentTest::forgetSystemBus(), true);

/** The program on a machine with a mock of systemd-logind. */
class LogindTest : public ProvidedTest {
protected:
    LogindTest() { configureLogind("delay = 3600\n"); }

    void configureLogind(const std::string& settings) const {
        std::ofstream(_folder / "agent.toml")
            << "[system]\nname = \"machine.example\"\n"
            << "[log]\ndestination = \"file\"\nfile = \"" << _folder.string() << "/log\"\n"
            << "[instrumentation]\nbackend = \"logind\"\n[instrumentation.logind]\n"
            << "lock-file = \"" << _folder.string() << "/lock\"\n"
            << settings;
    }

    /** Runs orvcim with the mock only. */
    Outcome run(const std::vector<std::string>& arguments) const {
        AgentTest::requireBusIn(_bus.folder());
        return orvcim(arguments);
    }

    /** The texts of the agent's log, without the numbers of processes and users. */
    std::vector<std::string> log() const {
        std::ifstream file(_folder / "log");
        std::vector<std::string> texts;
        for (std::string line; std::getline(file, line);) {
            line = std::regex_replace(line, std::regex("^[^ ]+ "), "");
            texts.push_back(std::regex_replace(line, std::regex("process [0-9]+, uid [0-9]+"), "process N, uid N"));
        }
        return texts;
    }

    const std::string _record = "log 10000 Corvane\\.Instrumentation reported "
                                "agent/instrumentation/Instrumentation\\.cpp:[0-9]+ ";
    const std::string _asked = " \\[asked by orvcim, process N, uid N\\]";
    PrivateBus _bus;
};

TEST_F(LogindTest, RebootsAndShutsDown) {
    const std::pair<const char*, const char*> requests[] = {{"reboot", "reboot"}, {"shutdown", "poweroff"}};
    for (const auto& [command, type] : requests) {
        _bus.startLogind();
        const Outcome outcome = run({"power", command, "--yes"});
        EXPECT_EQ(outcome.status, 0);
        EXPECT_EQ(outcome.err, "");
        const std::string accepted =
            std::string("Power request accepted: ") + command +
            " of this machine, node system, at 20[0-9-]+T[0-9:]+Z, in 3600 s \\[asked by orvcim, process ";
        EXPECT_THAT(outcome.out, MatchesRegex(accepted + "[0-9]+, uid [0-9]+\\]\n"));
        EXPECT_THAT(log().back(), MatchesRegex(_record + accepted + "N, uid N\\]"));
        EXPECT_THAT(_bus.requests(), ElementsAre(StartsWith(std::string("ScheduleShutdown \"") + type + "\" ")));
    }
}

TEST_F(LogindTest, AsksBeforeItActs) {
    _bus.startLogind();
    EXPECT_EQ(run({"power", "reboot"}).err, "orvcim: machine.example is not known to be a simulated machine: expected "
                                            "--yes, or a terminal on which to ask for confirmation\n");
    EXPECT_THAT(_bus.requests(), IsEmpty());
}

TEST_F(LogindTest, ShowsWhatTheMachineDoes) {
    const std::string heading = "SYSTEM           SERVICE                      POWER STATE\n"
                                "machine.example  PowerStateManagement_system  ";
    _bus.startLogind();
    EXPECT_EQ(run({"power", "status"}).out, heading + "2 (On)\n");
    run({"power", "reboot", "--yes"});
    EXPECT_EQ(run({"power", "status"}).out, heading + "1 (Other), as while it reboots or shuts down\n");
}

TEST_F(LogindTest, ShowsWhyTheMachineRefused) {
    _bus.startLogind(R"({"Inhibitors": [["shutdown", "apt", "upgrade", "block", 0, 77]]})");
    const std::string refused =
        "Power request refused: reboot of this machine, node system: inhibited by apt \\(upgrade; "
        "process [0-9N]+, uid [0-9N]+\\) \\[asked by orvcim, process ";
    const Outcome outcome = run({"power", "reboot", "--yes"});
    EXPECT_THAT(outcome.err, MatchesRegex("orvcim: " + refused + "[0-9]+, uid [0-9]+\\]\n"));
    EXPECT_EQ(outcome.out, "");
    EXPECT_EQ(outcome.status, 1);
    EXPECT_THAT(log(), ElementsAre(MatchesRegex(_record + refused + "N, uid N\\]")));
    EXPECT_THAT(_bus.requests(), IsEmpty());
}

TEST_F(LogindTest, ShowsThatThereIsNoSystemdLogind) {
    EXPECT_THAT(
        run({"power", "reboot", "--yes"}).err,
        StartsWith("orvcim: Power request refused: reboot of this machine, node system: systemd-logind is not on "
                   "the system bus: org.freedesktop.DBus.Error.ServiceUnknown: "));
    const Outcome status = run({"power", "status"});
    EXPECT_THAT(status.err, StartsWith("orvcim: the power state is unknown: The power state of this machine cannot be "
                                       "told: systemd-logind is not on the system bus: "));
    EXPECT_THAT(status.out, EndsWith("  unknown\n"));
    EXPECT_EQ(status.status, 1);
}

TEST_F(LogindTest, ShowsThatTheLibraryOfSystemdIsMissing) {
    std::filesystem::create_directory(_folder / "broken");
    std::ofstream(_folder / "broken/libsystemd.so.0") << "no library";
    setenv("LD_LIBRARY_PATH", (_folder / "broken").c_str(), 1);
    const Outcome outcome = run({"power", "reboot", "--yes"});
    unsetenv("LD_LIBRARY_PATH");
    EXPECT_THAT(outcome.err, AllOf(StartsWith("orvcim: Power request refused: reboot of this machine, node system: the "
                                              "system bus cannot be reached: "),
                                   HasSubstr("/broken/libsystemd.so.0: ")));
    EXPECT_EQ(outcome.status, 1);
}

TEST_F(LogindTest, ChecksWhatTheMachineCanDo) {
    _bus.startLogind(R"({"CanHibernate": "na"})");
    const Outcome outcome = run({"check"});
    EXPECT_EQ(outcome.err, "");
    EXPECT_EQ(outcome.status, 0);
    EXPECT_THAT(outcome.out,
                HasSubstr("Embedded agent: ok\n"
                          "  user           uid " +
                          std::to_string(geteuid()) +
                          "\n"
                          "  configuration  " +
                          (_folder / "agent.toml").string() +
                          "\n"
                          "  log            " +
                          (_folder / "log").string() +
                          ", level 6000\n"
                          "  machine        this machine through systemd-logind (requests take effect after 3600 s)\n"
                          "  under way      nothing\n"
                          "  reboot         yes\n"
                          "  shutdown       yes\n"
                          "  sleep          yes\n"
                          "  hibernation    na\n"));
    EXPECT_THAT(_bus.requests(), IsEmpty());
}

TEST_F(LogindTest, ChecksWhatIsMissing) {
    const Outcome withoutLogind = run({"check", "--format", "json"});
    EXPECT_EQ(withoutLogind.err, "orvcim: not usable: the embedded agent\n");
    EXPECT_EQ(withoutLogind.status, 1);
    EXPECT_THAT(withoutLogind.out,
                AllOf(HasSubstr("\"usable\": false"), HasSubstr("systemd-logind is not on the system bus: "),
                      HasSubstr(": install systemd-logind and start it (systemd-logind.service)\"")));

    _bus.startLogind(R"({"CanPowerOff": "challenge"})");
    const Outcome withoutRight = run({"check", "--format", "json"});
    EXPECT_EQ(withoutRight.status, 1);
    EXPECT_THAT(withoutRight.out, AllOf(HasSubstr("\"reboot\": \"yes\""), HasSubstr("\"shutdown\": \"challenge\""),
                                        HasSubstr("it needs the rights org.freedesktop.login1.power-off and ")));
}

} // namespace
} // namespace OrvcimTest
