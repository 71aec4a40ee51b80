// What an error says.

#pragma once

#include "trouble.h"

#include <string>

// "none" where `action` throws no `Error`.
template <typename Error = talcmp::Trouble, typename Action>
std::string thrown_message(const Action& action) {
    try {
        action();
    } catch (const Error& error) {
        return error.what();
    }
    return "none";
}
