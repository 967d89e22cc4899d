#ifndef LOG_HANGING_H
#define LOG_HANGING_H

namespace LogTest {

/** From now on, what writes to a regular file hangs until it is told to go on, as on a file system that is out of
 * reach. */
void hangFiles(bool hang);

/** Writes that hang now. */
int hangingWrites();

} // namespace LogTest

#endif
