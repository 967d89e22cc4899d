/**
 * Runs "orvcim serve" with the shipped files, on a free port, with a simulated machine.
 */
#ifndef TESTS_ORVCIM_SERVING_H
#define TESTS_ORVCIM_SERVING_H

#include "Provided.h"

#include <csignal>
#include <memory>
#include <string>
#include <utility>
#include <vector>

namespace OrvcimTest {

class ServingTest : public ProvidedTest {
protected:
    using Environment = std::map<std::string, std::string>;

    std::unique_ptr<RunningProcess> start(std::vector<std::string> options, Environment variables = {}) const {
        options.insert(options.begin(), {ORVCIM_PROGRAM, "serve"});
        variables.merge(environment());
        return std::make_unique<RunningProcess>(options, variables);
    }

    /** Serves on a free port. */
    void serve(std::vector<std::string> options = {}, const Environment& variables = {}) {
        options.insert(options.begin(), "--port=0");
        serveAs(start(options, variables));
    }

    /** Takes a program that begins to serve, and waits until it does. */
    void serveAs(std::unique_ptr<RunningProcess> server) {
        _server = std::move(server);
        const std::string line = _server->firstLine();
        ASSERT_NE(line, "") << _server->err();
        _port = line.substr(line.rfind(':') + 1);
    }

    /**
     * Writes the files of a PAM service whose users are root (password "top"), nobody ("small") and bin ("evil").
     * @param first a line before the others.
     * @return their folder.
     */
    std::string makeUsers(const std::string& first = "") const {
        const std::string module = std::string(TEST_PAM_MATRIX) + " passdb=" + (_folder / "users").string();
        std::ofstream(_folder / "users") << "root:top:orvcim\nnobody:small:orvcim\nbin:evil:orvcim\n";
        std::ofstream(_folder / "orvcim")
            << first << "auth required " << module << "\naccount required " << module << '\n';
        return _folder.string();
    }

    /** Makes a certificate for the name localhost. @return the file that has the certificate and its key. */
    std::string makeCertificate() const {
        const std::string file = (_folder / "server.pem").string();
        const Outcome made =
            runProcess({"openssl", "req", "-x509", "-newkey", "ec", "-pkeyopt", "ec_paramgen_curve:P-256", "-noenc",
                        "-days", "2", "-subj", "/CN=localhost", "-addext", "subjectAltName=DNS:localhost", "-keyout",
                        file + ".key", "-out", file + ".certificate"},
                       {});
        EXPECT_EQ(made.status, 0) << made.err;
        std::ofstream(file) << std::ifstream(file + ".certificate").rdbuf() << std::ifstream(file + ".key").rdbuf();
        std::filesystem::permissions(file, std::filesystem::perms::owner_read | std::filesystem::perms::owner_write);
        return file;
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
