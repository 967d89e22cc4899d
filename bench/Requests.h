/** The requests that the server is measured with. */
#ifndef BENCH_REQUESTS_H
#define BENCH_REQUESTS_H

#include <cstddef>
#include <string>
#include <string_view>
#include <vector>

namespace Bench {

/** A kind of CIM-XML request, and what a right reply has. */
struct Request {
    std::string name;
    std::string method;
    std::string object;
    std::string body;
    /** What each object of the reply begins with. */
    std::string_view objectBegin;
    /** Objects of the reply for each node of the machine, and besides. */
    std::size_t objectsPerNode;
    std::size_t objects;

    /** What is sent for it. @param headers besides, each with its line end. */
    std::string text(std::string_view headers = "") const;

    /** @throws std::runtime_error where a reply has another number of objects than a machine of so many nodes. */
    void check(const std::string& replyBody, std::size_t nodes) const;
};

/** The six kinds that clients ask most, of the first node's service or of its class. The method call is refused. */
const std::vector<Request>& requests();

} // namespace Bench

#endif
