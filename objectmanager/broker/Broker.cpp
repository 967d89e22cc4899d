#include "broker/Objects.h"

#include <cstdio>

namespace ObjectManager {

namespace {

void writeToStandardError(const BrokerMessage& message) {
    const std::string line = message.source + ": " + message.text + '\n';
    std::fputs(line.c_str(), stderr);
}

} // namespace

Broker::Broker(Operations* upCalls, const ClassInformation* classes)
    : _handle{this, &upCallTable, &factoryTable, &operatingSystemTable, &memoryTable}, _upCalls(upCalls),
      _classes(classes), _sink(writeToStandardError) {}

} // namespace ObjectManager
