#ifndef BASE_FOLDERS_H
#define BASE_FOLDERS_H

#include "Descriptor.h"

#include <filesystem>

namespace Norv::Agent {

/**
 * Makes a folder and its missing parents, as mkdir -p does, writable only for their owner. @throws std::system_error
 */
void createMissingFolders(const std::filesystem::path& folder);

/**
 * Checks that files can be made in a folder; if the folder is missing, that it can be made in its nearest existing
 * parent.
 *
 * @throws std::system_error if not; what() names the folder.
 */
void requireWritable(std::filesystem::path folder);

/**
 * Gives a file that root has just made to the owner of its folder: if a service with a user of its own owns the folder,
 * it could not use a file there that root owns. Files that other users make stay theirs.
 *
 * @return false if the owner could not be changed; errno says why.
 */
bool giveToOwnerOfFolder(const Descriptor& made, const std::string& path);

} // namespace Norv::Agent

#endif
