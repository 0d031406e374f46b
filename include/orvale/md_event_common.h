/*
 * Database-change events to the peer daemon "jsond".
 *
 * The event "/mgmtd/notify/dbchange" holds these bindings in this order, all below
 * "/mgmtd/notification/dbchange/0":
 *
 *     .../change_type            string  kind of the change
 *     (the node itself)          uint32  "0", the index of the one change in the event
 *     .../name                   name    full name of the changed node
 *     .../new_attribs/value      string  new value
 *     .../prev_attribs/value     string  previous value
 *
 * Sending is best effort: nothing is reported to the caller, failures are logged. Without a jsond
 * the event is dropped with a notice, and the notice that it was sent is written all the same.
 */
#ifndef ORVALE_MD_EVENT_COMMON_H
#define ORVALE_MD_EVENT_COMMON_H

#include "framework/types.h"
#include "orvale/ov_api.h"

OV_C_BEGIN

/*
 * Announces that node `param` changed from old_value to new_value, as change type "modify". An
 * event with a null argument is dropped with a warning.
 */
OV_API void md_send_dbc_event(const char *param, const char *new_value, const char *old_value);

/*
 * Announces a change of any kind. change_type and param must not be null, or the event is dropped
 * with a warning; a null value leaves its binding out.
 */
OV_API void md_send_dbc_event2(const char *change_type, const char *param, const char *new_value,
                               const char *old_value);

OV_C_END

#endif
