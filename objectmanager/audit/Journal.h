/** The system's journal, which keeps fields beside a message. */
#ifndef AUDIT_JOURNAL_H
#define AUDIT_JOURNAL_H

#include <string>
#include <utility>
#include <vector>

struct iovec;

namespace ObjectManager::Audit {

/**
 * The journal of systemd, where the process's standard error goes to it. systemd's library is loaded then only, so that
 * others do without. Used by several threads at once.
 */
class Journal {
public:
    /** Names, in the form that systemd.journal-fields(7) demands, and values of any bytes. */
    using Fields = std::vector<std::pair<std::string, std::string>>;

    Journal();

    /** One entry, without the fields whose value is empty. @return false where the journal did not take it. */
    bool write(const Fields& fields) const;

private:
    using Send = int(const iovec* fields, int count);

    /** sd_journal_sendv(3); null where there is no journal. */
    Send* _send = nullptr;
};

} // namespace ObjectManager::Audit

#endif
