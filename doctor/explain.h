#ifndef TAVOSSO_DOCTOR_EXPLAIN_H
#define TAVOSSO_DOCTOR_EXPLAIN_H

#include <json/json.h>

#include <string>
#include <vector>

#include "web/failure_table.h"

// Prints the table of failures (web/failure_table.cpp) and of error codes (provider_errors.cpp), or the rows for a
// text.
namespace Doctor {

struct Explanation {
    const TAVO::Web::FailureRow *failure;
    std::string about;  // the text of the table
};

/// Returns the rows for a text. Ignores case and a final full stop if there is no exact match.
std::vector<Explanation> LookUp(const std::string &text);

/// Returns all texts.
std::vector<Explanation> AllExplanations();

/// For a terminal.
std::string WithoutBackticks(const std::string &text);

void PrintExplanations(const std::vector<Explanation> &explanations);
Json::Value ExplanationsAsJson(const std::vector<Explanation> &explanations);

/// Prints the tables of the documents, between the comments that mark them there.
void PrintMarkdown();

}  // namespace Doctor

#endif
