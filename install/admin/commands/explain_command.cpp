#include "install/admin/commands/commands.h"
#include "install/admin/explanations.h"
#include "install/admin/input_file.h"

namespace kz7 {
namespace {

struct ExplainOptions {
    std::vector<std::string> words;
};

std::string lineText(const LineExplanation& row) {
    return compose("error line %u of %s\n  step:     %s\n  cause:    %s\n  on disk:  %s\n  next:     %s\n",
                   {row.line, row.options, row.step, row.cause, row.left, row.next});
}

std::string statusText(const StatusExplanation& row, std::string_view seen) {
    const std::string shown = seen.empty() ? std::string{} : compose(" (seen as %s in a POSIX shell)", {seen});
    return compose("status %u%s: %s\n  cause:    %s\n  next:     %s\n",
                   {row.status, shown, row.name, row.cause, row.next});
}

std::string meaningsText(const Meanings& meanings, std::string_view word) {
    std::string text;
    for (const LineExplanation* const row : meanings.lines) {
        text += lineText(*row);
    }
    for (const StatusExplanation* const row : meanings.statuses) {
        text += statusText(*row, {});
    }
    for (const StatusExplanation* const row : meanings.seenInShell) {
        text += statusText(*row, word);
    }
    return text;
}

void appendMeanings(const Meanings& meanings, JsonWriter& json) {
    for (const LineExplanation* const row : meanings.lines) {
        json.beginObject().field("line", row->line).field("options", row->options);
        json.field("step", row->step).field("cause", row->cause).field("left", row->left);
        json.field("next", row->next).end();
    }
    for (const auto* const statuses : {&meanings.statuses, &meanings.seenInShell}) {
        for (const StatusExplanation* const row : *statuses) {
            json.beginObject().field("status", row->status).field("name", row->name);
            json.field("cause", row->cause).field("next", row->next);
            json.field("exitCode", row->isExitCode).end();
        }
    }
}

Answer explain(Admin& admin, const ExplainOptions& options) {
    if (!admin.open(true, true)) {
        return kAnswerFault;
    }
    JsonWriter json = beginDocument();
    json.field("meanings").beginArray();
    std::string text;
    Answer answer = kAnswerYes;
    for (const std::string& word : options.words) {
        Meanings meanings;
        if (word == "-") {
            InputFile input(admin, word);
            if (const Answer read = input.read(); read != kAnswerYes) {
                return read;
            }
            meanings = findMentioned(input.bytes());
        } else if (!findMeanings(word, meanings)) {
            return admin.fault("not a number: " + shownText(word) + " (give a status, an error line's number or -)");
        }
        text += meaningsText(meanings, word);
        appendMeanings(meanings, json);
        if (meanings.empty()) {
            answer = admin.no(word == "-" ? "no known error: standard input"
                                          : "neither an error line nor a status of this system: " + shownText(word));
        }
    }
    const Answer written = admin.isJson ? admin.writeJson(json.end()) : admin.write(text);
    return written != kAnswerYes ? written : answer;
}

}  // namespace

void addExplainCommand(Command& program, Admin& admin) {
    auto command = program.add("explain", "Explain a status, an exit code or an error line");
    auto& options = command.answerWith(admin, explain);
    command.describe(
        "WHAT is a status (5021, 0x870F0104), an exit code as a POSIX shell shows it\n"
        "(157), the number of an error line (392), or \"-\" for pasted output or a log.");
    command.texts("WHAT", options.words, "What to explain").isRequired();
    command.json(admin);
}

}  // namespace kz7
