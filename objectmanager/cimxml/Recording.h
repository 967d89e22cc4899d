/** Makes the record of a message: who made which request, in the client's own words. */
#ifndef CIMXML_RECORDING_H
#define CIMXML_RECORDING_H

#include "audit/CallRecord.h"
#include "cimxml/RequestReader.h"
#include "classes/Catalogue.h"
#include "server/HttpMessage.h"

#include <string>

namespace ObjectManager::CimXml {

/** Each text is one line of limited length. A malformed message is recorded as far as it can be read. */
Audit::CallRecord recordOf(const Message& message, const Server::Caller& caller, const Catalogue& catalogue,
                           Audit::Verdict verdict, const std::string& reason);

} // namespace ObjectManager::CimXml

#endif
