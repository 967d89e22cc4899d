#ifndef BASE_FOLDEROFFILE_H
#define BASE_FOLDEROFFILE_H

#include "Descriptor.h"

#include <sys/types.h>

#include <string>

namespace Norv::Agent {

/**
 * The folder of a file, which is held open so that no other folder can take its place between two steps.
 *
 * Users who may change the folder cannot redirect what root does here. From the first folder in the path that belongs
 * to another user, or that others may write to, root follows no symbolic link, and opens no file that has a second
 * name. Other users follow links: these lead only to files that they could change anyway.
 */
class FolderOfFile {
public:
    /** @param file an absolute path. If its folder cannot be opened, isOpen() is false and errno says why. */
    explicit FolderOfFile(const std::string& file);

    bool isOpen() const { return _folder.isOpen(); }
    /** The folder's descriptor, for calls such as renameat(2). */
    int number() const { return _folder.number(); }
    /** The file's name in the folder. */
    const std::string& name() const { return _name; }

    /**
     * Opens the file as open(2) does.
     *
     * @return a descriptor that is not open if that fails; errno says why: ELOOP and EMLINK for a link and for a second
     * name that root does not accept.
     */
    Descriptor openFile(int flags, mode_t mode = 0) const;

private:
    std::string _name;
    bool _isGuarded = false;
    Descriptor _folder;
};

} // namespace Norv::Agent

#endif
