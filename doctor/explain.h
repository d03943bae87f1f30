#ifndef TAVOSSO_DOCTOR_EXPLAIN_H
#define TAVOSSO_DOCTOR_EXPLAIN_H

#include <json/json.h>

#include <string>
#include <vector>

#include "web/failure_table.h"

// Prints the table of failures, and what it has about a text. The texts are in web/failure_table.cpp.
namespace Doctor {

struct Explanation {
    const TAVO::Web::FailureRow *failure;
    std::string about;  // the text of the table
};

/// Of each kind of failure, the most specific text of the table that `text` ends in.
std::vector<Explanation> LookUp(const std::string &text);

/// Each text of the table.
std::vector<Explanation> AllExplanations();

/// As a terminal shows it.
std::string WithoutBackticks(const std::string &text);

void PrintExplanations(const std::vector<Explanation> &explanations);
Json::Value ExplanationsAsJson(const std::vector<Explanation> &explanations);

/// The tables of the documents, each between the comments that mark it there.
void PrintMarkdown();

}  // namespace Doctor

#endif
