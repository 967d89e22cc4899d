#include "text/Writer.h"

#include "text/Writers.h"

namespace ObjectManager {

std::unique_ptr<Writer> makeWriter(Format format, std::ostream& out, const Catalogue& catalogue) {
    switch (format) {
    case Format::json:
        return std::make_unique<JsonWriter>(out);
    case Format::mof:
        return std::make_unique<MofWriter>(out);
    case Format::table:
        break;
    }
    return std::make_unique<TableWriter>(out, catalogue);
}

} // namespace ObjectManager
