#include "orvcim/Commands.h"

namespace ObjectManager::Orvcim {

void listAssociators(Session& session) {
    const Options& options = session.options();
    const ObjectPath source = session.instancePath(options.target);
    session.writer().associatedInstances(
        session.dispatcher().associators(Session::invocation(), source, options.filter, options.properties));
}

void listAssociatorNames(Session& session) {
    const Options& options = session.options();
    const ObjectPath source = session.instancePath(options.target);
    session.writer().associatedNames(
        session.dispatcher().associatorNames(Session::invocation(), source, options.filter));
}

void listReferences(Session& session) {
    const Options& options = session.options();
    const ObjectPath source = session.instancePath(options.target);
    session.writer().instances(
        session.dispatcher().references(Session::invocation(), source, options.filter, options.properties));
}

void listReferenceNames(Session& session) {
    const Options& options = session.options();
    const ObjectPath source = session.instancePath(options.target);
    session.writer().names(session.dispatcher().referenceNames(Session::invocation(), source, options.filter));
}

} // namespace ObjectManager::Orvcim
