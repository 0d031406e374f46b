#include "host/ovctl/render_history.h"

#include "host/ovctl/render.h"
#include "host/ovctl/render_parts.h"
#include "host/ovctl/terminal.h"
#include "host/support/commit_range.h"

#include <nlohmann/json.hpp>

#include <array>
#include <ctime>
#include <ostream>
#include <string>

namespace ovhost
{

using nlohmann::json;

namespace
{

std::string number_of(const json &object, const char *member)
{
    return std::to_string(count_of(object, member));
}

/// In the user's time zone, without its name.
std::string time_of(const json &commit)
{
    const std::time_t seconds = count_of(commit, "time");
    std::tm local{};
    std::array<char, 64> text{};
    if (::localtime_r(&seconds, &local) == nullptr ||
        std::strftime(text.data(), text.size(), "%Y-%m-%d %H:%M:%S", &local) == 0) {
        return std::to_string(seconds);
    }
    return text.data();
}

/// "waiting", "confirmed by 8", "undone by 8"; empty for a commit that never waited.
std::string state_of(const json &commit)
{
    const json &confirmation = commit.at("confirmation");
    if (confirmation.is_null()) {
        return {};
    }
    const std::string by =
        confirmation.at("by").is_null() ? "" : " by " + number_of(confirmation, "by");
    return text_of(confirmation, "state") + by;
}

std::string remark_of(const json &commit)
{
    const std::string state = state_of(commit);
    const std::string comment = text_of(commit, "comment");
    if (state.empty()) {
        return comment.empty() ? "-" : comment;
    }
    return "[" + state + "]" + (comment.empty() ? "" : " " + comment);
}

std::string author_of(const json &commit)
{
    const json &author = commit.at("author");
    const std::string user = text_of(author, "user");
    return author.at("uid").is_null() ? user : user + " (uid " + number_of(author, "uid") + ")";
}

/// Those that waited together, with the verb.
std::string commits_of(const json &wait, const char *one, const char *several)
{
    const auto number = [&wait](const char *member) {
        return static_cast<std::uint64_t>(count_of(wait, member));
    };
    return commit_range(number("back_to"), number("number"), one, several);
}

void print_refusal(const json &object, std::ostream &out)
{
    if (!object.at("undo_refusal").is_null()) {
        out << "the last try to undo failed: " << text_of(object, "undo_refusal") << '\n';
    }
}

void print_stored_commit(const json &event, std::ostream &out)
{
    const json &commit = event.at("commit");
    out << styled(out, Style::heading, "commit " + number_of(commit, "number")) << " by "
        << text_of(commit.at("author"), "user") << " at " << time_of(commit) << ", "
        << counted(count_of(commit, "changes"), "change", "changes");
    if (const std::string comment = text_of(commit, "comment"); !comment.empty()) {
        out << ": " << comment;
    }
    out << '\n';
    if (event.at("changes").is_null()) {
        out << "too many changes to show here: run ovctl show commit "
            << number_of(commit, "number") << '\n';
    } else {
        render_diff(event, out);
    }
}

} // namespace

void render_event(const json &event, std::ostream &out)
{
    const auto &kind = event.at("kind").get_ref<const std::string &>();
    if (kind == "commit") {
        print_stored_commit(event, out);
    } else if (kind == "gap") {
        out << styled(out, Style::warning, "missed") << ' '
            << counted(count_of(event, "left_out"), "commit", "commits")
            << ", which came faster than they were read: run ovctl history\n";
    }
}

void render_wait(const json &result, std::ostream &out)
{
    if (const auto confirmed = result.find("confirmed"); confirmed != result.end()) {
        out << commits_of(*confirmed, "is", "are") << " confirmed\n";
    }
    const auto waits = result.find("waits");
    if (waits == result.end() || waits->is_null()) {
        return;
    }
    out << commits_of(*waits, "is", "are") << " undone in "
        << counted(count_of(*waits, "seconds_left"), "second", "seconds")
        << " unless confirmed: run ovctl confirm\n";
    print_refusal(*waits, out);
}

void render_history(const json &result, std::ostream &out)
{
    const json &commits = result.at("commits");
    TableRows rows{{"COMMIT", "TIME", "AUTHOR", "CHANGES", "COMMENT"}};
    for (const json &commit : commits) {
        rows.push_back({number_of(commit, "number"), time_of(commit),
                        text_of(commit.at("author"), "user"), number_of(commit, "changes"),
                        remark_of(commit)});
    }
    if (commits.empty()) {
        out << "no commits\n";
    } else {
        print_table(out, rows);
    }
    render_wait(result, out);
}

void render_recorded_commit(const json &result, std::ostream &out)
{
    const json &commit = result.at("commit");
    print_fact(out, "commit", number_of(commit, "number"));
    print_fact(out, "time", time_of(commit));
    print_fact(out, "author", author_of(commit));
    if (const std::string comment = text_of(commit, "comment"); !comment.empty()) {
        print_fact(out, "comment", comment);
    }
    if (!commit.at("rollback_to").is_null()) {
        print_fact(out, "back to commit", number_of(commit, "rollback_to"));
    }
    if (const std::string state = state_of(commit); !state.empty()) {
        print_fact(out, "confirmation", state);
        print_refusal(commit.at("confirmation"), out);
    }
    print_fact(out, "changes", number_of(commit, "changes"));
    render_diff(result, out);
}

void render_confirmation(const json &result, std::ostream &out)
{
    render_wait(result, out);
}

} // namespace ovhost
