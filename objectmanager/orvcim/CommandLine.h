/**
 * The program orvcim.
 */
#ifndef ORVCIM_COMMANDLINE_H
#define ORVCIM_COMMANDLINE_H

namespace ObjectManager::Orvcim {

/**
 * Runs the command that the command line names.
 *
 * @return the exit status: 0 if the command succeeded, 1 if it failed, 2 if the command line is wrong. A failure is
 *         reported in one line on standard error.
 */
int run(int argc, const char* const* argv);

} // namespace ObjectManager::Orvcim

#endif
