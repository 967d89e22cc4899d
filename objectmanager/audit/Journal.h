/** Writes to the system's journal, which stores fields with each message. */
#ifndef AUDIT_JOURNAL_H
#define AUDIT_JOURNAL_H

#include <string>
#include <utility>
#include <vector>

struct iovec;

namespace ObjectManager::Audit {

/**
 * Access to systemd's journal for a process whose standard error goes there. systemd's library is loaded in such a
 * process only. Used by several threads at once.
 */
class Journal {
public:
    /** Names in the form that systemd.journal-fields(7) demands, with values that may contain any bytes. */
    using Fields = std::vector<std::pair<std::string, std::string>>;

    Journal();

    /** Writes one entry; fields with empty values are left out. @return false if the journal did not take it. */
    bool write(const Fields& fields) const;

private:
    using Send = int(const iovec* fields, int count);

    /** sd_journal_sendv(3); null if the process has no journal. */
    Send* _send = nullptr;
};

} // namespace ObjectManager::Audit

#endif
