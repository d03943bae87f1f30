#ifndef TAVOSSO_DOCTOR_REPORT_H
#define TAVOSSO_DOCTOR_REPORT_H

#include <json/json.h>

#include <cstddef>
#include <ctime>
#include <string>
#include <vector>

// The results of the checks, as text or as one JSON object.
namespace Doctor {

/// Increases when a member of the JSON is removed or changes its meaning. New members and ids do not change it.
constexpr int kJsonVersion = 1;

/// Returns one line without control characters. Invalid bytes are replaced.
std::string Printable(const std::string &text);

std::string Quoted(const std::string &text);

/// Formats a time in UTC with strftime. Returns the number if the year has more than four digits.
std::string TimeText(std::time_t time, const char *format);

/// Writes to standard output.
void WriteJson(const Json::Value &json);

enum class Mark {
    kGood,
    kNote,        // does not affect sign-in
    kFinding,     // to be fixed
    kNotChecked,  // because of an earlier finding, or not requested
};

struct Check {
    std::string id;  // does not change its meaning
    std::string subject;
    Mark mark = Mark::kGood;
    std::string found;
    std::string remedy;   // an instruction, or empty
    std::string library;  // the exception with which the library ends such a login, or empty
};

struct Presentation {
    bool isJson = false;
    bool isVerbose = false;
    bool isQuiet = false;
    bool hasColours = false;
    std::size_t width = 0;  // of the terminal, in characters; 0: lines are not wrapped
};

/// Collects the results and prints them at the end: findings first. Texts are printed on one line, without control
/// characters, and without what `Hide` has received.
class Report {
  public:
    explicit Report(Presentation presentation) : presentation_(presentation) {}

    /// Replaces a secret, a code or a token in all output, also in percent-encoding.
    void Hide(const std::string &secret);

    /// Begins a group of checks.
    void Section(const std::string &title);

    void Add(Check check);
    void Good(const std::string &id, const std::string &subject, const std::string &found);
    void Note(const std::string &id, const std::string &subject, const std::string &found,
              const std::string &remedy = "");
    void Finding(const std::string &id, const std::string &subject, const std::string &found,
                 const std::string &remedy);
    void NotChecked(const std::string &id, const std::string &subject, const std::string &why);

    /// A line of --verbose.
    void Detail(const std::string &text);

    /// Something that the checks cannot prove. Printed if there are no findings.
    void Unproved(const std::string &what);

    /// A result that the user asked for. Printed after the checks.
    void Result(const std::string &text);

    /// Prints text for a person at once.
    void Say(const std::string &text);

    bool HasFindings() const;

    /// Prints the report. `more` has members of the JSON object; `nextStep` is printed if there are no findings.
    void Finish(const std::string &command, const std::string &nextStep = "",
                const Json::Value &more = Json::Value(Json::objectValue));

  private:
    struct Group {
        std::string title;
        std::vector<Check> checks;
        std::vector<std::string> details;
    };

    std::vector<Check> ChecksOf(Mark mark) const;
    std::string Redact(std::string text) const;
    void Print(const Check &check) const;
    void PrintMark(Mark mark) const;
    void PrintWrapped(const std::string &text, std::size_t indent, std::size_t column) const;
    void PrintGroups() const;
    void PrintSummary(const Group &group) const;
    void PrintEnd(const std::string &nextStep) const;
    void PrintJson(const std::string &command, const Json::Value &more) const;

    Presentation presentation_;
    std::vector<std::string> hidden_;
    std::vector<Group> groups_;
    std::vector<std::string> unproved_;
    std::vector<std::string> results_;
};

}  // namespace Doctor

#endif
