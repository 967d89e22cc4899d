/** The requests with which the server is measured. */
#ifndef BENCH_REQUESTS_H
#define BENCH_REQUESTS_H

#include <cstddef>
#include <string>
#include <string_view>
#include <vector>

namespace Bench {

/** A kind of CIM-XML request, and what a correct reply contains. */
struct Request {
    std::string name;
    std::string method;
    std::string object;
    std::string body;
    /** The text with which each object in the reply begins. */
    std::string_view objectBegin;
    /** How many objects the reply has for each node of the machine, and how many more. */
    std::size_t objectsPerNode;
    std::size_t objects;

    /** The text of the request. @param headers further headers, each with its line end. */
    std::string text(std::string_view headers = "") const;

    /** @throws std::runtime_error if the reply does not have the number of objects that the machine's nodes make. */
    void check(const std::string& replyBody, std::size_t nodes) const;
};

/** The six most frequent kinds, for the first node's service or its class. The method call is refused. */
const std::vector<Request>& requests();

} // namespace Bench

#endif
