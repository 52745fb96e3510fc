// Which of the records that fit a disc is meant.
#pragma once

#include "media/CddbLookup.h"

#include <cstdio>

namespace host {

enum class EChoice {
    made,
    refused, // by an empty answer or Ctrl-C
    open,    // several fit, or none exactly, and there is no terminal to ask on
};

struct SCddbChoice {
    EChoice kind;
    size_t candidate; // if made
};

// The one with the number `pick` (from 1 on) or the one that is clear; otherwise asks on the terminal. Throws
// std::runtime_error if there is no such number. There must be candidates.
SCddbChoice chooseRecord(const CCddbLookup& lookup, int pick);

// One candidate a line, with its number.
void printCandidates(const CCddbLookup& lookup, std::FILE* to);
// The message for an open choice, on standard error.
void reportOpenChoice(const CCddbLookup& lookup);
// The message for a disc without candidates.
std::string describeNoMatch(const SDiscToc& toc);

} // namespace host
