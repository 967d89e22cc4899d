/*
 * Every wrong request for a reboot: the machine's state does not change, the client gets the reason, and the log names
 * the client.
 */
#include "Serving.h"

#include <gmock/gmock.h>

#include <sys/socket.h>
#include <sys/un.h>
#include <unistd.h>

#include <array>

namespace OrvcimTest {
namespace {

using testing::AllOf;
using testing::EndsWith;
using testing::HasSubstr;
using testing::MatchesRegex;
using testing::Not;

constexpr const char* alice = "root:top";
constexpr const char* bob = "nobody:small";

class WrongRequestTest : public ServingTest {
protected:
    /** Serves root, who may do everything, and nobody, who may read. */
    void serveUsers(const Environment& variables = {}, std::vector<std::string> options = {}) {
        options.insert(options.begin(), {"--authenticate", "--pam-folder", makeUsers(), "--power-group=daemon",
                                         "--allow-root", "--allow-without-shell"});
        serve(options, variables);
    }

    Outcome reboot(const std::string& element, const std::string& user = alice) const {
        return wbemcli({"cm", url(_service, user), "RequestPowerStateChange.PowerState=5,ManagedElement=" + element});
    }

    /**
     * Expects that the machine's state has not changed, that the client got `reason`, and that the log has it with the
     * client's name.
     */
    void expectRefused(const Outcome& outcome, const std::string& reason, const std::string& user = "root",
                       const std::string& verdict = "refused") const {
        EXPECT_NE(outcome.status, 0);
        EXPECT_THAT(outcome.out + outcome.err, HasSubstr(reason));
        EXPECT_FALSE(std::filesystem::exists(_folder / "state.json")) << "the machine moved";
        EXPECT_THAT(_server->errWith(": " + verdict + ": "),
                    AllOf(HasSubstr("Z 127.0.0.1 " + user +
                                    ": TALVO_PowerManagementService.RequestPowerStateChange(PowerState=5, "
                                    "ManagedElement="),
                          HasSubstr(reason)));
    }
};

TEST_F(WrongRequestTest, NamesAnotherMachine) {
    serveUsers();
    std::string other = _system;
    other.replace(other.find("machine.example"), 15, "other.example");
    expectRefused(reboot(other), "there is no instance root/cimv2:TALVO_ComputerSystem.");
}

TEST_F(WrongRequestTest, NamesAnotherClass) {
    serveUsers();
    expectRefused(reboot(_capabilities), "expected an element whose power the service manages: root/cimv2:TALVO_Comp");
}

TEST_F(WrongRequestTest, NamesNoInstance) {
    serveUsers();
    expectRefused(reboot("root/cimv2:TALVO_ComputerSystem"),
                  "ManagedElement: found no key Name, expected every key of TALVO_ComputerSystem");
}

TEST_F(WrongRequestTest, HasAnotherType) {
    serveUsers();
    expectRefused(reboot("5"),
                  "ManagedElement: found a path of the class 5, which is not declared, expected the path of an "
                  "instance");
}

TEST_F(WrongRequestTest, ComesFromAUserWithoutRights) {
    serveUsers();
    expectRefused(reboot(_system, bob), "nobody may read, but not change anything", "nobody", "denied");
}

TEST_F(WrongRequestTest, FindsNoAgent) {
    std::ofstream(_folder / "agent.toml") << "[instrumentation]\nbackend = \"guess\"\n[instrumentation.simulated]\n"
                                          << "state-file = \"" << (_folder / "state.json").string() << "\"\n";
    serveUsers();
    expectRefused(reboot(_system), "expected \"simulated\"");
    const Outcome again = reboot(_system);
    EXPECT_THAT(again.out + again.err, HasSubstr("expected \"simulated\"")) << "as often as it is asked";
}

TEST_F(WrongRequestTest, FindsAFullDisk) {
    // The agent cannot write its log either.
    serveUsers({{"LD_PRELOAD", TEST_FULL_DISK}, {"TEST_FULL_FOLDER", _folder.string()}});
    expectRefused(reboot(_system), "No space left on device");
}

TEST_F(WrongRequestTest, IsNotHeardToHaveBeenAccepted) {
    serveUsers({{"ORVCIM_TEST_ANSWER", "nothing"}},
               {"--schema", ORVCIM_TEST_SCHEMA, "--provider-path", ORVCIM_TEST_LIBRARIES});
    const std::string service =
        "root/cimv2:TALVO_PowerManagementService.CreationClassName=\"TALVO_PowerManagementService\",Name=\"service1\","
        "SystemCreationClassName=\"TALVO_ComputerSystem\",SystemName=\"testhost\"";
    expectRefused(wbemcli({"cm", url(service, alice),
                           "RequestPowerStateChange.PowerState=5,ManagedElement=root/cimv2:TALVO_ComputerSystem."
                           "CreationClassName=\"TALVO_ComputerSystem\",Name=\"testhost\""}),
                  "ended without a failure, but the agent accepted no power request");
}

/* The right way, to compare, and requests that are none for another power state. */

TEST_F(WrongRequestTest, IsNoneWhereEverythingIsRight) {
    serveUsers();
    EXPECT_THAT(reboot(_system).out, EndsWith("RequestPowerStateChange: 0\n"));
    EXPECT_TRUE(std::filesystem::exists(_folder / "state.json"));
    EXPECT_THAT(_server->errWith(": accepted: "),
                AllOf(HasSubstr("Z 127.0.0.1 root: TALVO_PowerManagementService.Request"),
                      HasSubstr(": accepted: Power request accepted: reboot of simulated node"),
                      HasSubstr("on behalf of root from 127.0.0.1]\n")));
}

TEST_F(WrongRequestTest, IsRecordedWhateverItAsksFor) {
    serveUsers();
    wbemcli({"di", url(_system, bob)});
    EXPECT_THAT(_server->errWith("change anything\n"),
                MatchesRegex("orvcim: [0-9TZ:-]* 127.0.0.1 nobody: DeleteInstance\\(InstanceName=.*\\) "
                             "of root/cimv2: denied: nobody may read, but not change anything\n"));
}

TEST_F(WrongRequestTest, IsNotRecordedWhereItOnlyReads) {
    serveUsers();
    wbemcli({"ein", url("root/cimv2:TALVO_ComputerSystem", bob)});
    // Log lines stand in the order of the requests.
    wbemcli({"di", url(_system, bob)});
    EXPECT_THAT(_server->errWith("change anything\n"), Not(HasSubstr("EnumerateInstanceNames")));
}

/** A socket that receives what is sent to the journal. */
class Journal {
public:
    explicit Journal(const std::filesystem::path& file) {
        sockaddr_un address{};
        address.sun_family = AF_UNIX;
        file.string().copy(static_cast<char*>(address.sun_path), sizeof address.sun_path - 1);
        EXPECT_EQ(bind(_socket, reinterpret_cast<const sockaddr*>(&address), sizeof address), 0);
        const timeval longest{30, 0};
        setsockopt(_socket, SOL_SOCKET, SO_RCVTIMEO, &longest, sizeof longest);
    }
    Journal(const Journal&) = delete;
    Journal& operator=(const Journal&) = delete;
    ~Journal() { close(_socket); }

    /** Waits for the next entry. */
    std::string entry() const {
        std::array<char, 65536> bytes{};
        const ssize_t size = recv(_socket, bytes.data(), bytes.size(), 0);
        return {bytes.data(), size < 0 ? 0 : static_cast<std::size_t>(size)};
    }

private:
    const int _socket = socket(AF_UNIX, SOCK_DGRAM | SOCK_CLOEXEC, 0);
};

TEST_F(WrongRequestTest, IsAnEntryOfTheJournalWithFieldsUnderSystemd) {
    const Journal journal(_folder / "journal");
    const std::vector<std::string> command = {"/bin/sh",
                                              "-c",
                                              "JOURNAL_STREAM=$(stat -L -c %d:%i /proc/self/fd/2) exec \"$0\" \"$@\"",
                                              ORVCIM_PROGRAM,
                                              "serve",
                                              "--port=0",
                                              "--authenticate",
                                              "--pam-folder",
                                              makeUsers(),
                                              "--power-group=daemon",
                                              "--allow-root",
                                              "--allow-without-shell"};
    Environment variables = environment();
    variables.insert({{"LD_PRELOAD", TEST_JOURNAL_REDIRECT}, {"TEST_JOURNAL_SOCKET", (_folder / "journal").string()}});
    serveAs(std::make_unique<RunningProcess>(command, variables));

    reboot(_system, bob);
    const std::string entry = journal.entry();
    for (const char* field :
         {"ORV_USER=nobody\n", "ORV_ADDRESS=127.0.0.1\n", "ORV_CLASS=TALVO_PowerManagementService\n",
          "ORV_METHOD=RequestPowerStateChange\n", "ORV_ARGUMENTS=PowerState=5, ManagedElement=", "ORV_OUTCOME=denied\n",
          "ORV_REASON=nobody may read, but not change anything\n", "PRIORITY=4\n", "SYSLOG_IDENTIFIER=orvcim\n",
          "MESSAGE=127.0.0.1 nobody: TALVO_PowerManagementService.Request"}) {
        EXPECT_THAT(entry, HasSubstr(field));
    }
    reboot(_system, alice);
    EXPECT_THAT(journal.entry(), AllOf(HasSubstr("ORV_USER=root\n"), HasSubstr("ORV_OUTCOME=accepted\n"),
                                       HasSubstr("ORV_REASON=Power request accepted: reboot of simulated node")));
    EXPECT_EQ(_server->err(), "");
}

} // namespace
} // namespace OrvcimTest
