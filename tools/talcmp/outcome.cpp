#include "outcome.h"

namespace talcmp {

void count(Summary& summary, const Outcome::Kind kind) {
    switch (kind) {
    case Outcome::Kind::same:
        ++summary.same;
        break;
    case Outcome::Kind::different:
        ++summary.different;
        break;
    case Outcome::Kind::only_in_first:
        ++summary.only_in_first;
        break;
    case Outcome::Kind::only_in_second:
        ++summary.only_in_second;
        break;
    case Outcome::Kind::trouble:
        ++summary.trouble;
        break;
    case Outcome::Kind::skipped:
        ++summary.skipped;
        break;
    }
}

std::uint64_t total(const Summary& summary) {
    return summary.same + summary.different + summary.only_in_first + summary.only_in_second
           + summary.trouble + summary.skipped;
}

int exit_status(const Summary& summary) {
    if (summary.trouble != 0) {
        return 2;
    }
    return summary.different + summary.only_in_first + summary.only_in_second != 0 ? 1 : 0;
}

} // namespace talcmp
