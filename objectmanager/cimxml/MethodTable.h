/** The operations that a message can ask for. */
#ifndef CIMXML_METHODTABLE_H
#define CIMXML_METHODTABLE_H

#include "cimxml/Enumerations.h"
#include "cimxml/RequestReader.h"
#include "cimxml/ResponseWriter.h"
#include "cimxml/Service.h"

namespace ObjectManager::CimXml {

/** One operation, and all that is needed to answer it. */
struct Operation {
    Dispatcher& dispatcher;
    const Catalogue& catalogue;
    const Message& message;
    const Caller& caller;
    ResponseWriter& writer;
    /** Takes the text that the writer has written. */
    ReplyStream& stream;
    Enumerations& enumerations;

    /** On whose behalf providers are called. */
    Invocation invocation() const;
};

/**
 * Carries out the operation that the message asks for, if the caller has the right to, and writes the content of the
 * element IMETHODRESPONSE or METHODRESPONSE.
 *
 * @return a text on the outcome of a method beyond its return value; mostly empty.
 * @throws CimError if the operation fails, ProtocolError if an element lacks something that the document type requires.
 *         What has been written by then must be dropped.
 */
std::string perform(const Operation& operation);

} // namespace ObjectManager::CimXml

#endif
