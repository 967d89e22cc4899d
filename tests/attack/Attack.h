/**
 * The server as it is reached by other machines, with TLS and log-ins, under an attack that comes from 127.0.0.0/8,
 * which counts as one network, while users ask from ::1.
 */
#ifndef TESTS_ATTACK_ATTACK_H
#define TESTS_ATTACK_ATTACK_H

#include "objectmanager/orvcim/Serving.h"
#include "objectmanager/server/HttpClient.h"

#include <chrono>
#include <cstdint>
#include <deque>
#include <functional>
#include <optional>
#include <string>
#include <vector>

namespace AttackTest {

using namespace std::chrono_literals;
using ServerTest::HttpClient;
using ServerTest::logInAs;
using ServerTest::post;

/** Sanitizers make everything slow, and large. */
#if defined(__SANITIZE_ADDRESS__) || defined(__SANITIZE_THREAD__)
constexpr bool isSanitized = true;
#else
constexpr bool isSanitized = false;
#endif

class AttackTest : public OrvcimTest::ServingTest {
protected:
    AttackTest();

    /** Serves the tests' own provider beside the shipped ones. */
    void serveWithLogIns(std::vector<std::string> options = {}, Environment variables = {});

    /**
     * Runs a step of an attack again and again: for a while, and so many times at least. Meanwhile a user reads the
     * power state, and in the end another one, who has not logged in before, switches the machine off.
     */
    void attack(const std::function<void()>& step, unsigned int least = 1);

    /**
     * A connection of the attacker's, from anywhere in 127.0.0.0/8, in the clear or with TLS; no value where it is not
     * let in.
     */
    std::optional<HttpClient> attacker();
    std::optional<HttpClient> attackerWithTls();

    /** Keeps the connection: of very many, the oldest goes for a new one. */
    void hold(std::optional<HttpClient> connection);
    /** Keeps a connection that begins with the text: with TLS, or in the clear. */
    void hold(const std::string& text);
    void holdInTheClear(const std::string& text);
    /** Keeps such a connection with TLS among several on which nothing comes. */
    void holdSometimes(const std::string& text);
    /** One more connection whose request comes byte by byte, and a few bytes of the others'. */
    void holdSlow();
    /** Makes a hundred connections, and closes them. */
    void storm();

    /** Requests for all objects of a class, or for the one of a name. @param user "name:password" */
    static std::string enumerate(const std::string& className, const std::string& nameSpace, const std::string& user);
    static std::string get(const std::string& className, const std::string& name, const std::string& nameSpace,
                           const std::string& user);

    /** Reads the many objects of the tests' own provider. */
    void readMuch() const;

    /** What the user does while the attack lasts. Throws where the answer is not what it should be. */
    std::function<void()> _ask = [this] { readPowerState(); };

    /** Half of the user's waits must be shorter: what is promised, and what a busy machine does not easily exceed. */
    std::chrono::milliseconds _usualPatience = isSanitized ? 10s : 1s;
    /** The longest wait that a test lets pass, on a machine that has much else to do. */
    std::chrono::milliseconds _patience = isSanitized ? 30s : 10s;

    std::deque<HttpClient> _held;
    std::size_t _mostHeld = 600;
    unsigned int _attackers = 0;
    /** The number of the slow connection that gets the next byte. */
    std::size_t _next = 0;

private:
    /** The whole answer to the request, to a user from ::1 on a new connection. */
    std::string answerTo(const std::string& request) const;
    void readPowerState() const;
    void switchOff() const;
    std::uint16_t port() const { return static_cast<std::uint16_t>(std::stoi(_port)); }
};

/** The beginning of a request. */
constexpr const char* begunRequest = "POST / HTTP/1.1\r\nHost: localhost\r\nX: ";

/** How long each attack goes on. */
std::chrono::milliseconds attackTime();

} // namespace AttackTest

#endif
