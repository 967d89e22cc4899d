#ifndef LOG_OBSERVATION_H
#define LOG_OBSERVATION_H

#include "Record.h"

namespace OrvLog {

/** Hands a record to the observer of the process, where there is one that wants it: see OrvLog/Observer.h. */
void showToObserver(const Record& record);

} // namespace OrvLog

#endif
