#include "install/admin/formats/html_report.h"

#include <algorithm>
#include <map>
#include <sstream>

#include "install/admin/formats/html_page.h"
#include "install/platform/text.h"

namespace kz7 {
namespace {

constexpr std::size_t kDrawn = 120;        // prefixes in the drawing; all are in the table
constexpr std::size_t kDrawnName = 22;     // characters of a name in the drawing
constexpr std::uint32_t kLineHeight = 22;  // of the drawing, in its own units

std::string orNone(const std::string& html) {
    return html.empty() ? "<span class=\"note\">none</span>" : html;
}

std::vector<std::string> findingRow(const Finding& finding) {
    const bool isFault = finding.kind().mark == Mark::fault;
    const std::string kind(finding.kind().name);
    return {isFault ? "<span class=\"bad\">" + kind + "</span>" : kind, std::string(markName(finding.kind().mark)),
            escaped(finding.what()), escaped(finding.why()), "<code>" + escaped(finding.repair()) + "</code>"};
}

void appendFindings(const ReportSource& source, std::string& html) {
    beginSection("findings", "Findings", html);
    std::vector<std::vector<std::string>> shown;
    std::vector<std::vector<std::string>> others;
    bool isInOrder = true;
    for (const Finding& finding : source.findings) {
        (finding.kind().isShown ? shown : others).push_back(findingRow(finding));
        isInOrder = isInOrder && finding.kind().mark != Mark::fault;
    }
    const std::vector<std::string_view> headings = {"Kind", "Mark", "What", "Why", "Repair"};
    html += isInOrder ? "<p class=\"good\">All is in order.</p>\n" : "<p class=\"bad\">Not all is in order.</p>\n";
    if (!shown.empty()) {
        appendTable("Findings", headings, shown, html);
    }
    if (!others.empty()) {
        html += "<details><summary>What is deliberate or not installed yet</summary>\n";
        appendTable("What is deliberate or absent", headings, others, html);
        html += "</details>\n";
    }
    html += "</section>\n";
}

void appendCopies(const ReportSource& source, std::string& html) {
    beginSection("copies", "Copies", html);
    std::vector<std::vector<std::string>> rows;
    for (const CopyLine& line : source.copies) {
        rows.push_back(
            {escaped(line.shown->name) + (line.isDefault ? " (default)" : ""), line.view,
             escaped(line.shown->info.getVersion()),
             line.shown->info.isValid() ? "yes" : "<span class=\"bad\">no</span>",
             orNone(escaped(line.shown->location)),
             orNone(line.service.empty() ? std::string{} : escaped(line.service) + ' ' + escaped(line.state))});
    }
    if (rows.empty()) {
        html += "<p>No copy is installed.</p>\n";
    } else {
        appendTable("Copies", {"Name", "View", "Version", "Valid", "Location", "Service"}, rows, html);
    }
    html += "</section>\n";
}

// An alias of a view, and whether it is not as it should be.
struct DrawnAlias {
    std::string prefix;
    std::string target;  // empty: none
    std::string why;     // not empty: stale
};

std::vector<DrawnAlias> aliasesOf(const ReportSource& source, std::size_t view) {
    std::vector<DrawnAlias> aliases;
    for (const AliasRow* const row : aliasRows(source.machine)) {
        if (row->values[view] || row->should) {
            const auto finding = judgeAlias(source.machine, *row, view, true);
            aliases.push_back({row->prefix, row->values[view] ? row->values[view]->text : std::string{},
                               finding ? finding->why() : std::string{}});
        }
    }
    return aliases;
}

std::string number(std::size_t value) {
    return std::to_string(value);
}

void appendText(std::size_t x, std::size_t y, bool isStale, std::string_view text, std::string& svg) {
    svg += "<text x=\"" + number(x) + "\" y=\"" + number(y) + (isStale ? "\" class=\"stale\">" : "\">");
    svg += cutEscaped(text, kDrawnName) + "<title>" + escaped(text) + "</title></text>\n";
}

// Prefixes on the left, the copies that they name on the right; what is stale comes first.
void appendDrawing(std::vector<DrawnAlias> aliases, std::string_view view, std::string& html) {
    std::stable_sort(aliases.begin(), aliases.end(), [](const DrawnAlias& left, const DrawnAlias& right) {
        return !left.why.empty() && right.why.empty();
    });
    aliases.resize(std::min(aliases.size(), kDrawn));
    std::map<std::string, std::size_t> targets;  // with their places
    for (const DrawnAlias& alias : aliases) {
        targets.try_emplace(foldUpper(alias.target), targets.size());
    }
    const auto stale =
        std::count_if(aliases.begin(), aliases.end(), [](const DrawnAlias& one) { return !one.why.empty(); });
    const std::size_t height = (std::max(aliases.size(), targets.size()) + 1) * kLineHeight;
    html += "<div class=\"scroll\"><svg role=\"img\" viewBox=\"0 0 420 " + number(height) + "\" aria-label=\"";
    html += compose("%s view: %u aliases drawn to their copies, %u of them stale\">\n",
                    {view, static_cast<std::uint32_t>(aliases.size()), static_cast<std::uint32_t>(stale)});
    std::vector<bool> isDrawn(targets.size(), false);
    for (std::size_t row = 0; row < aliases.size(); ++row) {
        const DrawnAlias& alias = aliases[row];
        const std::size_t target = targets.at(foldUpper(alias.target));
        const std::size_t y = (row + 1) * kLineHeight;
        const std::size_t step = std::max<std::size_t>(aliases.size() / std::max<std::size_t>(targets.size(), 1), 1);
        const std::size_t end = (target * step + 1) * kLineHeight;
        const bool isStale = !alias.why.empty();
        appendText(4, y, isStale, alias.prefix, html);
        html += "<line x1=\"150\" y1=\"" + number(y - 4) + "\" x2=\"246\" y2=\"" + number(end - 4) +
                (isStale ? "\" class=\"stale\">" : "\">");
        html += "<title>" + escaped(alias.prefix + " -> " + (alias.target.empty() ? "none" : alias.target)) +
                (isStale ? ": " + escaped(alias.why) : std::string{}) + "</title></line>\n";
        if (!isDrawn[target]) {
            isDrawn[target] = true;
            appendText(252, end, false, alias.target.empty() ? "(none)" : alias.target, html);
        }
    }
    html += "</svg></div>\n";
}

void appendAliases(const ReportSource& source, std::string& html) {
    beginSection("aliases", "Version aliases", html);
    for (std::size_t view = 0; view < kViews.size(); ++view) {
        const std::vector<DrawnAlias> aliases = aliasesOf(source, view);
        html.append("<h3>").append(kViews[view].name).append(" view</h3>\n");
        if (aliases.empty()) {
            html += "<p>No alias exists.</p>\n";
            continue;
        }
        appendDrawing(aliases, kViews[view].name, html);
        if (aliases.size() > kDrawn) {
            html += compose(
                "<p class=\"note\">The drawing has %u of %u aliases, stale ones first; the table has all.</p>\n",
                {static_cast<std::uint32_t>(kDrawn), static_cast<std::uint32_t>(aliases.size())});
        }
        std::vector<std::vector<std::string>> rows;
        rows.reserve(aliases.size());
        for (const DrawnAlias& alias : aliases) {
            rows.push_back({escaped(alias.prefix), orNone(escaped(alias.target)),
                            alias.why.empty() ? "right" : "<span class=\"bad\">" + escaped(alias.why) + "</span>"});
        }
        html += "<details><summary>All aliases of this view as a table</summary>\n";
        appendTable("Aliases", {"Prefix", "Copy", "State"}, rows, html);
        html += "</details>\n";
    }
    html += "</section>\n";
}

void appendServices(const ReportSource& source, std::string& html) {
    beginSection("services", "Services", html);
    std::vector<std::vector<std::string>> rows;
    for (const ServiceRow& service : source.machine.services) {
        rows.push_back({escaped(service.name), escaped(service.copy), orNone(escaped(service.program)),
                        service.start == 2   ? "automatic"
                        : service.start == 3 ? "on demand"
                        : service.start == 4 ? "<span class=\"bad\">disabled</span>"
                                             : number(service.start)});
    }
    if (rows.empty()) {
        html += "<p>No service is registered.</p>\n";
    } else {
        appendTable("Services", {"Name", "Copy", "Program", "Start"}, rows, html);
    }
    html += "</section>\n";
}

void appendRuns(const ReportSource& source, std::string& html) {
    constexpr std::size_t kLongestText = 20000;  // bytes of the changes of a run
    beginSection("runs", "Last runs", html);
    if (source.runs.empty()) {
        html += "<p>No run is recorded.</p>\n";
    }
    for (const ReportedRun& run : source.runs) {
        std::string text = run.changes;
        if (text.size() > kLongestText) {
            text.resize(text.rfind('\n', kLongestText) + 1);
            text += "... (kz7admin history shows all)\n";
        }
        html += "<details><summary>" + escaped(run.title) + "</summary>\n<pre class=\"scroll\" tabindex=\"0\">";
        std::istringstream lines(text);
        for (std::string line; std::getline(lines, line);) {
            html += escaped(line) + '\n';
        }
        html += "</pre></details>\n";
    }
    html += "</section>\n";
}

}  // namespace

std::string htmlReport(const ReportSource& source) {
    std::string html = pageStart("Installed copies", {source.store, source.host, source.time},
                                 {{"findings", "Findings"},
                                  {"copies", "Copies"},
                                  {"aliases", "Version aliases"},
                                  {"services", "Services"},
                                  {"runs", "Last runs"}});
    appendFindings(source, html);
    appendCopies(source, html);
    appendAliases(source, html);
    appendServices(source, html);
    appendRuns(source, html);
    return html + pageEnd();
}

}  // namespace kz7
