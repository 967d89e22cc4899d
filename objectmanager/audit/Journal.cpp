#include "audit/Journal.h"

#include <dlfcn.h>
#include <sys/stat.h>
#include <sys/uio.h>
#include <unistd.h>

#include <cstdlib>

namespace ObjectManager::Audit {

namespace {

/**
 * Compares standard error with the device and inode of the stream to the journal, which JOURNAL_STREAM gives
 * (systemd.exec(5)).
 */
bool isStandardErrorTheJournal() {
    const char* const stream = std::getenv("JOURNAL_STREAM");
    struct stat status {};
    return stream != nullptr && fstat(STDERR_FILENO, &status) == 0 &&
           std::to_string(status.st_dev) + ':' + std::to_string(status.st_ino) == stream;
}

} // namespace

Journal::Journal() {
    if (isStandardErrorTheJournal()) {
        if (void* const library = dlopen("libsystemd.so.0", RTLD_NOW | RTLD_NODELETE)) {
            _send = reinterpret_cast<Send*>(dlsym(library, "sd_journal_sendv"));
        }
    }
}

bool Journal::write(const Fields& fields) const {
    if (_send == nullptr) {
        return false;
    }
    std::vector<std::string> texts;
    texts.reserve(fields.size());
    std::vector<iovec> pieces;
    for (const auto& [name, value] : fields) {
        if (!value.empty()) {
            std::string& text = texts.emplace_back(name + '=' + value);
            pieces.push_back({text.data(), text.size()});
        }
    }
    return _send(pieces.data(), static_cast<int>(pieces.size())) == 0;
}

} // namespace ObjectManager::Audit
