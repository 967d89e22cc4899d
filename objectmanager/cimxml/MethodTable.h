/** The operations that a message can ask for. */
#ifndef CIMXML_METHODTABLE_H
#define CIMXML_METHODTABLE_H

#include "cimxml/Enumerations.h"
#include "cimxml/RequestReader.h"
#include "cimxml/ResponseWriter.h"
#include "cimxml/Service.h"

namespace ObjectManager::CimXml {

/** One operation, and where its answer goes. */
struct Operation {
    Dispatcher& dispatcher;
    const Catalogue& catalogue;
    const Message& message;
    const Caller& caller;
    ResponseWriter& writer;
    /** Where what is written goes. */
    ReplyStream& stream;
    Enumerations& enumerations;
};

/**
 * Does what the message asks for, if the caller may, and writes what stands in the IMETHODRESPONSE or METHODRESPONSE.
 *
 * @return what is known of a method's outcome beyond its return value; mostly nothing.
 * @throws CimError where it fails, ProtocolError where an element lacks what the document type demands. What was
 * written by then is of no use.
 */
std::string perform(const Operation& operation);

} // namespace ObjectManager::CimXml

#endif
