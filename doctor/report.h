#ifndef TAVOSSO_DOCTOR_REPORT_H
#define TAVOSSO_DOCTOR_REPORT_H

#include <json/json.h>

#include <ctime>
#include <string>
#include <vector>

// What was found, for people line by line as it comes, or for machines as one JSON object at the end.
namespace Doctor {

/// Counts up when a member of the JSON is taken away or changes its meaning. One more member or id does not change it.
constexpr int kJsonVersion = 1;

/// On one line, and of characters alone that a terminal shows and does not obey. What is none in UTF-8 is replaced.
std::string Printable(const std::string &text);

std::string Quoted(const std::string &text);

/// In UTC, as strftime's format has it; the bare number where the year takes more than four digits.
std::string TimeText(std::time_t time, const char *format);

/// On standard output.
void WriteJson(const Json::Value &json);

enum class Mark {
    kGood,
    kNote,        // worth knowing, and no reason why a login would fail
    kFinding,     // something to be put right
    kNotChecked,  // because of an earlier finding, or because it was not asked for
};

/// One thing that was looked at.
struct Check {
    std::string id;  // for machines, and for looking it up: it keeps its meaning
    std::string subject;
    Mark mark = Mark::kGood;
    std::string found;
    std::string remedy;   // empty unless there is something to do
    std::string library;  // the library's own word for it: the text of the exception that ends such a login
};

struct Presentation {
    bool isJson = false;
    bool isVerbose = false;
    bool hasColours = false;
};

/**
 * Collects and prints. Whatever comes from outside is put on one line, without control characters: a provider's answer
 * must not move an administrator's cursor. What `Hide` has been told is printed by nothing in here.
 */
class Report {
  public:
    explicit Report(Presentation presentation) : presentation_(presentation) {}

    /// A secret, a code or a token: no text that holds it is printed as it stands, nor one with its percent-encoding.
    void Hide(const std::string &secret);

    void Section(const std::string &title);
    void Add(Check check);
    void Good(const std::string &id, const std::string &subject, const std::string &found);
    void Note(const std::string &id, const std::string &subject, const std::string &found,
              const std::string &remedy = "");
    void Finding(const std::string &id, const std::string &subject, const std::string &found,
                 const std::string &remedy);
    void NotChecked(const std::string &id, const std::string &subject, const std::string &why);

    /// What only whoever asks for more wants to see.
    void Detail(const std::string &text);

    /// For people alone: what to do next, where a command talks with them.
    void Say(const std::string &text);

    bool HasFindings() const;

    /// The last line, or the JSON object: of a command, with what it has to tell beside the checks.
    void Finish(const std::string &command, const Json::Value &more = Json::Value(Json::objectValue));

  private:
    std::string Redact(std::string text) const;
    void Print(const Check &check) const;
    void PrintNotChecked() const;

    Presentation presentation_;
    std::vector<std::string> hidden_;
    std::vector<Check> checks_;
};

}  // namespace Doctor

#endif
