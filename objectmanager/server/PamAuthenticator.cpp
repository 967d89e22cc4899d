#include "server/PamAuthenticator.h"

#include <security/pam_appl.h>

#include <fmt/format.h>

#include <grp.h>
#include <pwd.h>
#include <unistd.h>

#include <algorithm>
#include <cerrno>
#include <cstdlib>
#include <cstring>
#include <fstream>
#include <memory>
#include <optional>
#include <utility>
#include <vector>

namespace ObjectManager::Server {

namespace {

/**
 * Answers PAM's question for the password. Messages that PAM only wants to show are dropped; for these, a module may
 * pass no room for answers.
 */
int converse(int count, const pam_message** messages, pam_response** responses, void* data) {
    const auto isOf = [](int style) {
        return [style](const pam_message* message) { return message->msg_style == style; };
    };
    if (std::any_of(messages, messages + count, isOf(PAM_PROMPT_ECHO_ON))) {
        return PAM_CONV_ERR;
    }
    if (responses == nullptr) {
        return std::any_of(messages, messages + count, isOf(PAM_PROMPT_ECHO_OFF)) ? PAM_CONV_ERR : PAM_SUCCESS;
    }
    auto* const answers = static_cast<pam_response*>(calloc(static_cast<std::size_t>(count), sizeof(pam_response)));
    if (answers == nullptr) {
        return PAM_BUF_ERR;
    }
    for (int i = 0; i < count; ++i) {
        if (messages[i]->msg_style == PAM_PROMPT_ECHO_OFF) {
            answers[i].resp = strdup(static_cast<const std::string*>(data)->c_str());
        }
    }
    *responses = answers;
    return PAM_SUCCESS;
}

/** Replaces PAM's sleep after a failure: the server waits itself, after it has given its turn to others. */
void doNotSleep(int /*result*/, unsigned int /*microseconds*/, void* /*data*/) {}

/** A conversation with PAM. Every function except the constructor returns PAM's code. */
class Conversation {
public:
    Conversation(const PamSettings& settings, const std::string& user, std::string password)
        : _password(std::move(password)) {
        const pam_conv conversation{converse, &_password};
        _result = pam_start_confdir(settings.service.c_str(), user.c_str(), &conversation,
                                    settings.folder.empty() ? nullptr : settings.folder.c_str(), &_handle);
    }
    Conversation(const Conversation&) = delete;
    Conversation& operator=(const Conversation&) = delete;
    ~Conversation() {
        if (_handle != nullptr) {
            pam_end(_handle, _result);
        }
    }

    int logIn(const std::string& address) {
        const auto delay = &doNotSleep;
        // pam_set_item takes a pointer to an object, also for this function.
        const void* item = nullptr;
        std::memcpy(&item, &delay, sizeof item);
        call([&] { return pam_set_item(_handle, PAM_FAIL_DELAY, item); });
        call([&] { return pam_set_item(_handle, PAM_RHOST, address.c_str()); });
        call([&] { return pam_authenticate(_handle, PAM_SILENT | PAM_DISALLOW_NULL_AUTHTOK); });
        call([&] { return pam_acct_mgmt(_handle, PAM_SILENT | PAM_DISALLOW_NULL_AUTHTOK); });
        return _result;
    }

    std::string problem() { return pam_strerror(_handle, _result); }

    /** The user's name after the log-in: a module may have replaced the name that he gave. */
    std::string user() {
        const void* name = nullptr;
        call([&] { return pam_get_item(_handle, PAM_USER, &name); });
        return name == nullptr ? "" : static_cast<const char*>(name);
    }

private:
    template <typename Call>
    void call(Call what) {
        if (_result == PAM_SUCCESS) {
            _result = what();
        }
    }

    std::string _password;
    pam_handle_t* _handle = nullptr;
    int _result = PAM_SUCCESS;
};

/** Calls one of the system's functions that need a buffer, with a larger one until it suffices. */
template <typename Entry, typename Call>
bool look(Entry& entry, std::vector<char>& room, Call call) {
    constexpr std::size_t firstSize = 1024;
    constexpr std::size_t maximumSize = std::size_t{16} * 1024 * 1024;
    Entry* found = nullptr;
    int error = ERANGE;
    for (room.resize(firstSize); error == ERANGE && room.size() <= maximumSize; room.resize(2 * room.size())) {
        error = call(&entry, room.data(), room.size(), &found);
        if (error != ERANGE) {
            break;
        }
    }
    return found != nullptr;
}

std::optional<gid_t> idOfGroup(const std::string& name) {
    group entry{};
    std::vector<char> room;
    const bool found = look(entry, room, [&](group* result, char* buffer, std::size_t size, group** foundEntry) {
        return getgrnam_r(name.c_str(), result, buffer, size, foundEntry);
    });
    return found ? std::optional(entry.gr_gid) : std::nullopt;
}

/** Whether shells(5) lists the shell; those of accounts that belong to no person are not listed. */
bool isLogInShell(const std::string& shell) {
    std::ifstream shells("/etc/shells");
    std::string line;
    while (std::getline(shells, line)) {
        if (!shell.empty() && line == shell) {
            return true;
        }
    }
    return false;
}

/** What the system knows of a user. An unknown user is in no group. */
struct User {
    bool root = false;
    bool hasShell = false;
    std::vector<gid_t> groups;

    bool isIn(const std::string& group) const {
        const std::optional<gid_t> id = idOfGroup(group);
        return id && std::find(groups.begin(), groups.end(), *id) != groups.end();
    }
};

User userNamed(const std::string& name) {
    User user;
    passwd entry{};
    std::vector<char> room;
    const bool found = look(entry, room, [&](passwd* result, char* buffer, std::size_t size, passwd** foundEntry) {
        return getpwnam_r(name.c_str(), result, buffer, size, foundEntry);
    });
    if (found) {
        user.root = entry.pw_uid == 0;
        user.hasShell = isLogInShell(entry.pw_shell);
        int count = 0;
        getgrouplist(name.c_str(), entry.pw_gid, nullptr, &count);
        user.groups.resize(static_cast<std::size_t>(count));
        getgrouplist(name.c_str(), entry.pw_gid, user.groups.data(), &count);
        user.groups.resize(static_cast<std::size_t>(count));
    }
    return user;
}

} // namespace

LogIn PamAuthenticator::logIn(const std::string& user, const std::string& password, const std::string& address) {
    Conversation conversation(_settings, user, password);
    if (conversation.logIn(address) != PAM_SUCCESS) {
        return {std::nullopt, conversation.problem()};
    }
    const std::string name = conversation.user();
    const User known = userNamed(name);
    if (known.root && !_settings.allowRoot) {
        return {std::nullopt, "root may not log in (see --allow-root)"};
    }
    if (!known.root && !known.hasShell && !_settings.allowWithoutShell) {
        return {std::nullopt, "the user has no log-in shell (see --allow-without-shell)"};
    }
    const bool mayChangePower = known.root || known.isIn(_settings.powerGroup);
    const bool mayRead = mayChangePower || _settings.readGroup.empty() || known.isIn(_settings.readGroup);
    return {Caller{name, mayRead, mayChangePower}, ""};
}

bool groupExists(const std::string& name) {
    return idOfGroup(name).has_value();
}

} // namespace ObjectManager::Server
