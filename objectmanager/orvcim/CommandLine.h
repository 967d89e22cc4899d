/**
 * The program orvcim: from its command line to its exit status.
 */
#ifndef ORVCIM_COMMANDLINE_H
#define ORVCIM_COMMANDLINE_H

namespace ObjectManager::Orvcim {

/**
 * Does what the command line asks for.
 *
 * @return the exit status: 0 done, 1 failed, 2 a command line that cannot be done. Failures are one line on standard
 *         error.
 */
int run(int argc, const char* const* argv);

} // namespace ObjectManager::Orvcim

#endif
