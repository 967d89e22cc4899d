#include "LastOperation.h"

namespace OrvLog {

LastOperation& LastOperation::ofThisThread() {
    constinit thread_local LastOperation operation;
    return operation;
}

void LastOperation::remember(const Record& record) {
    _level = record.level;
    _line = record.line;
    _category.assign(record.category);
    _function.assign(record.function);
    _file.assign(record.file);
    _text.assign(record.text);
}

Record LastOperation::record() const {
    return {Kind::log, _level, _category.view(), _function.view(), _file.view(), _line, _text.view()};
}

} // namespace OrvLog
