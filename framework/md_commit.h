/*
 * A commit as its checks see it, the words a check refuses it with, and the peers of the daemon.
 */
#ifndef FRAMEWORK_MD_COMMIT_H
#define FRAMEWORK_MD_COMMIT_H

#include "framework/mdb_db.h"

OV_C_BEGIN

/* What every commit check receives. */
typedef struct md_dbinfo {
    md_commit *commit;   /* where a refusal is reported */
    const mdb_db *olddb; /* the database before the commit */
    const mdb_db *newdb; /* the proposed database; checks that amend it cast the const away */
} md_dbinfo;

/*
 * Refuses the commit with a message for the user; `text` is copied. The library always passes
 * code 1. A later call of the same check replaces the message.
 * Returns 0; 14001 on a null argument; 14002 when the commit can no longer be refused.
 */
OV_NODISCARD int md_commit_set_return_status_msg(md_commit *commit, int code, const char *text);

/* The same with a printf format. */
OV_NODISCARD int md_commit_set_return_status_msg_fmt(md_commit *commit, int code,
                                                     const char *format, ...) OV_PRINTF(3, 4);

/*
 * The open management session with a named peer daemon, borrowed; null when the peer is not
 * connected (not an error). Returns 0; 14001 on a null argument.
 */
OV_NODISCARD int md_gcl_find_session(const char *peer_name, gcl_session **ret);

OV_C_END

#endif
