#ifndef LOG_OBSERVATION_H
#define LOG_OBSERVATION_H

#include "Record.h"

namespace OrvLog {

/** Calls the process's observer with a record, if there is one and the level is high enough: see OrvLog/Observer.h. */
void showToObserver(const Record& record);

} // namespace OrvLog

#endif
