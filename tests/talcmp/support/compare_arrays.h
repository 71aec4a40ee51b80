// Comparisons of two arrays, which messages call "a" and "b".

#pragma once

#include "comparison.h"

#include <cstdint>
#include <memory>
#include <utility>

using Source = std::unique_ptr<talcmp::ArraySource>;

inline talcmp::Comparison compare_arrays(Source first, Source second,
                                         const talcmp::Question& question,
                                         talcmp::ProgressListener& listener) {
    talcmp::AllBoxes boxes;
    return talcmp::compare({"a", std::move(first)}, {"b", std::move(second)}, {}, question, boxes,
                           listener);
}

inline talcmp::Comparison compare_arrays(Source first, Source second,
                                         const talcmp::Question& question) {
    talcmp::NoProgress listener;
    return compare_arrays(std::move(first), std::move(second), question, listener);
}

inline talcmp::Question question_of(const unsigned threads) {
    talcmp::Question question;
    question.threads = threads;
    return question;
}
