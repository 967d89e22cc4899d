#ifndef BASE_FOLDERS_H
#define BASE_FOLDERS_H

#include "Descriptor.h"

#include <filesystem>

namespace Norv::Agent {

/** As mkdir -p does, with a mode that gives nobody else more than reading. @throws std::system_error */
void createMissingFolders(const std::filesystem::path& folder);

/**
 * Whether files can be made in a folder, or in the one in which the first missing folder would be made.
 *
 * @throws std::system_error where they cannot; what() names the folder.
 */
void requireWritable(std::filesystem::path folder);

/**
 * Gives a file that root has just made to the owner of its folder: a service with a user of its own has the folder, and
 * could not use a file in it that is root's. A file of another user's making stays his.
 *
 * @return whether it is so; errno says why not.
 */
bool giveToOwnerOfFolder(const Descriptor& made, const std::string& path);

} // namespace Norv::Agent

#endif
