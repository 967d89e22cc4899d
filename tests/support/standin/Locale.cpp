#include "Norv/Locale.h"

#include "Agent.h"
#include "Transcript.h"

#include <mutex>
#include <utility>

namespace Norv {

using OrvTest::Agent;
using OrvTest::Transcript;

namespace {

/** The tests' texts are ASCII. */
std::string narrow(const std::wstring& text) {
    std::string result;
    for (const wchar_t character : text) {
        result += static_cast<char>(character);
    }
    return result;
}

} // namespace

class ResourceLibrary {
public:
    unsigned int number;
    unsigned int language;
};

namespace Locale {

unsigned int getLanguageId() {
    Agent& agent = Agent::instance();
    agent.faults.next("getLanguageId");
    Transcript::instance().call("getLanguageId() -> " + std::to_string(agent.language));
    return agent.language;
}

const ResourceLibrary& getResourceLibrary(unsigned int number, unsigned int language) {
    static std::mutex mutex;
    static std::map<std::pair<unsigned int, unsigned int>, ResourceLibrary> libraries;
    Agent::instance().faults.next("getResourceLibrary");
    Transcript::instance().call("getResourceLibrary(" + std::to_string(number) + ", " + std::to_string(language) + ")");
    const std::lock_guard lock(mutex);
    return libraries.try_emplace({number, language}, ResourceLibrary{number, language}).first->second;
}

} // namespace Locale

ResourceString::ResourceString(const ResourceLibrary& library, const std::wstring& id) {
    Agent& agent = Agent::instance();
    agent.faults.next("ResourceString");
    Transcript::instance().call("ResourceString(library " + std::to_string(library.number) + " in language " +
                                std::to_string(library.language) + ", " + narrow(id) + ")");
    const auto found = agent.texts.find(id);
    _text = found == agent.texts.end() ? id : found->second;
}

ResourceString::operator const std::wstring&() const {
    return _text;
}

std::string make_string(const std::wstring& text) {
    Agent::instance().faults.next("make_string");
    Transcript::instance().call("make_string(" + narrow(text) + ")");
    return narrow(text);
}

} // namespace Norv
