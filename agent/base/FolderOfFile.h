#ifndef BASE_FOLDEROFFILE_H
#define BASE_FOLDEROFFILE_H

#include "Descriptor.h"

#include <sys/types.h>

#include <string>

namespace Norv::Agent {

/**
 * The folder of a file, held open: nothing takes its place between one step and the next.
 *
 * What the superuser does here cannot be led elsewhere by those who may change the folder. From the first folder on
 * that belongs to another user, or that others may write to, he follows no symbolic link, and opens no file that has a
 * second name. Other users follow what they find: it leads them to nothing that they could not change anyway.
 */
class FolderOfFile {
public:
    /** @param file an absolute path. Where its folder cannot be opened, isOpen() is false and errno says why. */
    explicit FolderOfFile(const std::string& file);

    bool isOpen() const { return _folder.isOpen(); }
    /** For calls that take a folder, such as renameat(2). */
    int number() const { return _folder.number(); }
    /** The file's name in the folder. */
    const std::string& name() const { return _name; }

    /**
     * Opens the file as open(2) does.
     *
     * @return not open where that fails; errno says why: ELOOP for a link, and EMLINK for a second name, that the
     * superuser does not accept.
     */
    Descriptor openFile(int flags, mode_t mode = 0) const;

private:
    std::string _name;
    bool _isGuarded = false;
    Descriptor _folder;
};

} // namespace Norv::Agent

#endif
