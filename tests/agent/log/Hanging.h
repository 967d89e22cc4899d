#ifndef LOG_HANGING_H
#define LOG_HANGING_H

namespace LogTest {

/** From now on, writes to regular files hang, as on a file system that is out of reach; with false, they go on. */
void hangFiles(bool hang);

/** The number of writes that hang now. */
int hangingWrites();

} // namespace LogTest

#endif
