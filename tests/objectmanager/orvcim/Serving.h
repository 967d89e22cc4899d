/**
 * Runs "orvcim serve" with the shipped files, on a free port, with a simulated machine.
 */
#ifndef TESTS_ORVCIM_SERVING_H
#define TESTS_ORVCIM_SERVING_H

#include "Provided.h"

#include <csignal>
#include <memory>
#include <string>
#include <vector>

namespace OrvcimTest {

class ServingTest : public ProvidedTest {
protected:
    std::unique_ptr<RunningProcess> start(std::vector<std::string> options) const {
        options.insert(options.begin(), {ORVCIM_PROGRAM, "serve"});
        return std::make_unique<RunningProcess>(
            options, std::map<std::string, std::string>{{"ORV_AGENT_CONFIG", (_folder / "agent.toml").string()},
                                                        {"LC_ALL", "C"}});
    }

    /** Serves on a free port. */
    void serve(std::vector<std::string> options = {}) {
        options.insert(options.begin(), "--port=0");
        _server = start(options);
        const std::string line = _server->firstLine();
        ASSERT_NE(line, "") << _server->err();
        _port = line.substr(line.rfind(':') + 1);
    }

    /** Writes the files of a PAM service whose users are root (password "top") and nobody ("small"). @return its
     * folder. */
    std::string makeUsers() const {
        const std::string module = std::string(TEST_PAM_MATRIX) + " passdb=" + (_folder / "users").string();
        std::ofstream(_folder / "users") << "root:top:orvcim\nnobody:small:orvcim\n";
        std::ofstream(_folder / "orvcim") << "auth required " << module << "\naccount required " << module << '\n';
        return _folder.string();
    }

    /** Runs the stock client. @param options and, behind the path, arguments. */
    static Outcome wbemcli(std::vector<std::string> options) {
        options.insert(options.begin(), "wbemcli");
        return runProcess(options, {{"LC_ALL", "C"}});
    }

    /** An object or class as the stock client names it. @param path "root/cimv2:..." @param user "name:password" or
     * empty */
    std::string url(const std::string& path, const std::string& user = "", const std::string& scheme = "http") const {
        return scheme + "://" + (user.empty() ? "" : user + "@") + "localhost:" + _port + "/" + path;
    }

    std::unique_ptr<RunningProcess> _server;
    std::string _port;
};

} // namespace OrvcimTest

#endif
