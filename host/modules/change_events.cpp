#include "host/modules/change_events.h"

#include "host/modules/commit_access.h"
#include "host/modules/node_access.h"
#include "orvale/md_event_common.h"

namespace ovhost
{
namespace
{

const char *or_null(const std::optional<std::string> &text)
{
    return text ? text->c_str() : nullptr;
}

void announce(const mdb_db_change &change)
{
    const char *const name = ts_str(change.mdc_name);
    const std::optional<std::string> before = attribute_text(change.mdc_old_attribs);
    const std::optional<std::string> after = attribute_text(change.mdc_new_attribs);
    switch (change.mdc_change_type) {
    case mdct_add:
        md_send_dbc_event2("add", name, or_null(after), nullptr);
        break;
    case mdct_delete:
        md_send_dbc_event2("delete", name, nullptr, or_null(before));
        break;
    default:
        md_send_dbc_event(name, or_null(after), or_null(before));
    }
}

} // namespace

void ChangeEventsModule::notify(const mdb_db_change_array *changes)
{
    for (const mdb_db_change *const change : changes_in(changes)) {
        if (!change->mdc_no_notify) {
            announce(*change);
        }
    }
}

} // namespace ovhost
