#include "map_filler.h"

#include <algorithm>
#include <array>
#include <cmath>

namespace talcmp {
namespace {

bool has_nan(const ElementType& type, const unsigned char* const element) {
    const auto parts = type.parts(element);
    return std::isnan(parts[0]) || std::isnan(parts[1]);
}

// Only pairs that are the same under no tolerance below all digits can have a NaN.
bool may_have_nan(const Sameness sameness, const int all) {
    return sameness.from_one() >= all;
}

void find_levels(const Pairs& asked, const DigitSearch::Result& found, std::vector<Level>& levels) {
    const int all = all_digits(asked.type1(), asked.type2());
    std::array<Level, DigitSearch::class_count> level_of = {};
    std::array<bool, DigitSearch::class_count> doubtful = {};
    for (std::size_t each = 0; each < level_of.size(); ++each) {
        if (found.count[each] != 0) {
            level_of[each] = level_of_digits(found.sameness_of[each].digits());
            doubtful[each] = may_have_nan(found.sameness_of[each], all);
        }
    }
    levels.resize(asked.count());
    for (std::size_t i = 0; i < levels.size(); ++i) {
        const DigitSearch::Class class_of = found.class_of[i];
        const bool nan = doubtful[class_of]
                         && (has_nan(asked.type1(), asked.element1(i))
                             || has_nan(asked.type2(), asked.element2(i)));
        levels[i] = nan ? nan_level : level_of[class_of];
    }
}

} // namespace

MapFiller::MapFiller(const DifferenceMaps& maps, const Traversal& traversal,
                     const bool column_major)
    : maps_(maps), traversal_(traversal), column_major_(column_major) {
    if (column_major && !maps.empty()) {
        numbers_ = RowMajorNumbers(maps.front()->shape(), column_major);
    }
}

void MapFiller::add(const Box& box, const ChosenPairs& chosen, const DigitSearch::Result& found) {
    if (maps_.empty()) {
        return;
    }
    find_levels(chosen.asked(), found, levels_);
    const auto row = static_cast<std::size_t>(box.extent.back());
    for (std::size_t i = 0; i < levels_.size();) {
        const std::size_t first = chosen.index_of(i);
        const std::size_t end_of_row = (first / row + 1) * row;
        std::size_t count = 1;
        while (i + count < levels_.size() && levels_[i + count] == levels_[i]
               && chosen.index_of(i + count) == first + count && first + count < end_of_row) {
            ++count;
        }
        add_run(box, first, count, levels_[i]);
        i += count;
    }
}

void MapFiller::add_run(const Box& box, const std::size_t first, const std::size_t count,
                        const Level level) {
    const std::uint64_t number = traversal_.number(box, first);
    for (const auto& map : maps_) {
        if (!column_major_) {
            map->add_run(number, count, level);
            continue;
        }
        for (std::size_t i = 0; i < count; ++i) {
            map->add(numbers_.of(number + i), level);
        }
    }
}

} // namespace talcmp
