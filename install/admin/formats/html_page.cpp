#include "install/admin/formats/html_page.h"

#include "install/platform/text.h"

namespace kz7 {
namespace {

constexpr std::string_view kBeforeTitle =
    "<!DOCTYPE html>\n<html lang=\"en\">\n<head>\n<meta charset=\"utf-8\">\n"
    "<meta name=\"viewport\" content=\"width=device-width, initial-scale=1\">\n"
    "<meta http-equiv=\"Content-Security-Policy\" content=\"default-src 'none'; style-src 'unsafe-inline'\">\n"
    "<meta name=\"color-scheme\" content=\"light dark\">\n<title>";
constexpr std::string_view kAfterTitle =
    "</title>\n<style>\n"
    ":root{--ink:#1b1f24;--soft:#57606a;--page:#fff;--band:#f3f5f7;--line:#c8ced4;--bad:#b3202a;--good:#1a6b3c}\n"
    "@media "
    "(prefers-color-scheme:dark){:root{--ink:#e6e9ec;--soft:#a2abb5;--page:#14171a;--band:#1e2328;--line:#3d454d;"
    "--bad:#ff8a80;--good:#7fd6a0}}\n"
    "*{box-sizing:border-box}\n"
    "body{margin:0 auto;max-width:76rem;padding:1rem;background:var(--page);color:var(--ink);"
    "font:1rem/1.5 system-ui,sans-serif}\n"
    "h1{font-size:1.5rem;margin:.5rem 0}h2{font-size:1.15rem;margin:2rem 0 .5rem}h3{font-size:1rem;margin:1rem 0 "
    ".3rem}nav a{margin-right:1rem}\n"
    "header p,.note{color:var(--soft);overflow-wrap:anywhere}\n"
    ".scroll{overflow-x:auto}\n"
    "table{border-collapse:collapse;width:100%}\n"
    "th,td{text-align:left;vertical-align:top;padding:.3rem .7rem;border-bottom:1px solid var(--line)}\n"
    "thead th{background:var(--band)}td{overflow-wrap:break-word}tbody th{font-weight:600}\n"
    "code{font-family:ui-monospace,monospace;font-size:.92em}\n"
    ".bad{color:var(--bad);font-weight:600}.good{color:var(--good);font-weight:600}\n"
    "svg{display:block;width:100%;max-width:44rem;min-width:20rem}svg text{fill:var(--ink);font-size:12px}\n"
    "svg line{stroke:var(--soft);stroke-width:1.2}svg line.stale{stroke:var(--bad);stroke-width:2.2;stroke-dasharray:6 "
    "3}\n"
    "svg text.stale{fill:var(--bad);font-weight:600}\n"
    "a.skip{position:absolute;left:-99rem}a.skip:focus{position:static}\n"
    "@media (max-width:40rem){th,td{padding:.3rem .4rem;font-size:.9rem}}\n"
    "@media print{body{max-width:none}.scroll{overflow:visible}details{display:block}}\n"
    "</style>\n</head>\n<body>\n<a class=\"skip\" href=\"#findings\">Skip to the findings</a>\n";

}  // namespace

std::string pageStart(std::string_view title, const std::vector<std::string>& lines,
                      std::initializer_list<PageSection> sections) {
    std::string html(kBeforeTitle);
    html.append(title).append(kAfterTitle).append("<header><h1>").append(title).append("</h1>\n<p>");
    for (const std::string& line : lines) {
        html += (&line == lines.data() ? "" : "<br>") + escaped(line);
    }
    html += "</p></header>\n<nav aria-label=\"Sections\"><p>";
    for (const PageSection& section : sections) {
        html.append("<a href=\"#").append(section.id).append("\">").append(section.title).append("</a> ");
    }
    return html + "</p></nav>\n<main>\n";
}

std::string pageEnd() {
    return "</main>\n</body>\n</html>\n";
}

std::string escaped(std::string_view foreign) {
    std::string html;
    for (const char c : shownText(foreign)) {
        // clang-format off
        switch (c) {
            case '&':  html += "&amp;";  break;
            case '<':  html += "&lt;";   break;
            case '>':  html += "&gt;";   break;
            case '"':  html += "&quot;"; break;
            case '\'': html += "&#39;";  break;
            default:   html += c;        break;
        }
        // clang-format on
    }
    return html;
}

std::string cutEscaped(std::string_view foreign, std::size_t limit) {
    return fitsCharacters(foreign, limit) ? escaped(foreign) : escaped(cutText(foreign, limit - 1)) + "\xE2\x80\xA6";
}

void appendTable(std::string_view caption, const std::vector<std::string_view>& headings,
                 const std::vector<std::vector<std::string>>& rows, std::string& html) {
    html.append("<div class=\"scroll\" role=\"region\" tabindex=\"0\" aria-label=\"").append(caption);
    html += "\"><table>\n<thead><tr>";
    for (const std::string_view heading : headings) {
        html.append("<th scope=\"col\">").append(heading).append("</th>");
    }
    html += "</tr></thead>\n<tbody>\n";
    for (const std::vector<std::string>& row : rows) {
        html.append("<tr><th scope=\"row\">").append(row.front()).append("</th>");
        for (std::size_t cell = 1; cell < row.size(); ++cell) {
            html.append("<td>").append(row[cell]).append("</td>");
        }
        html += "</tr>\n";
    }
    html += "</tbody></table></div>\n";
}

void beginSection(std::string_view id, std::string_view title, std::string& html) {
    html.append("<section aria-labelledby=\"").append(id).append("\">\n<h2 id=\"").append(id).append("\">");
    html.append(title).append("</h2>\n");
}

}  // namespace kz7
