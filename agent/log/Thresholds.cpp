#include "Thresholds.h"

#include <algorithm>

namespace OrvLog {

Thresholds::Thresholds(const Norv::Agent::LogSettings& settings)
    : _general{settings.logLevel, settings.traceLevel}, _lowest(_general) {
    for (const auto& category : settings.categories) {
        const Levels levels{category.logLevel.value_or(_general.log), category.traceLevel.value_or(_general.trace)};
        _lowest = {std::min(_lowest.log, levels.log), std::min(_lowest.trace, levels.trace)};
        _categories.push_back({category.prefix, levels});
    }
    std::ranges::sort(_categories, std::ranges::greater{},
                      [](const Category& category) { return category.prefix.size(); });
}

bool Thresholds::passes(Kind kind, std::string_view category, int level) const {
    if (level < _lowest.of(kind)) {
        return false;
    }
    const auto matching = std::ranges::find_if(
        _categories, [category](const Category& candidate) { return category.starts_with(candidate.prefix); });
    return level >= (matching == _categories.end() ? _general : matching->levels).of(kind);
}

} // namespace OrvLog
