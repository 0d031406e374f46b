/*
 * The management tunnel cache: every tunnel's ID, name and alias, and the two tables that lead from
 * a name or an alias back to the ID.
 *
 * The cache is process-global and lives in memory only: the host fills it from its configuration
 * after each start. A name or alias that two tunnels claim leads to none of them.
 */
#ifndef ORVALE_MD_TUNBIN_HT_H
#define ORVALE_MD_TUNBIN_HT_H

#include "orvale/ov_api.h"
#include "orvale/ov_kvassoc.h"
#include "orvale/tunnel_defs.h"

OV_C_BEGIN

/* Slots of the cache: IDs 0 to 10021. */
#define MD_TUNBIN_HT_SIZE 10022u

/* Marks a name or alias in the tables that two tunnels have claimed. */
#define TUNBIN_HT_COLLISION 65534u

/*
 * Empties the cache and both tables and seeds the tables' hashes from the wall clock. Must be
 * called once before anything else here. Returns 0.
 */
OV_API int md_tunbin_ht_init(void);

/*
 * Records a tunnel.
 *
 * An ID in use is overwritten, and its old name and alias keep leading to it: delete a tunnel
 * before it is added under another name.
 *
 * vtunbin  a tunnel_config_bin_t, of which the three fields of tunnel_defs.h are read; a text that
 *          fills its field without a NUL is read without its last character; null: nothing is done
 * Returns 0; 14000 for an ID above 10021.
 */
OV_NODISCARD OV_API int md_tunbin_ht_add(const void *vtunbin);

/*
 * Forgets a tunnel: the slot of the record's ID, the record's name and the record's alias. One that
 * two tunnels claim leads to none until a tunnel is added with it again.
 *
 * vtunbin  as in md_tunbin_ht_add
 * Returns 0; 14000 for an ID above 10021.
 */
OV_NODISCARD OV_API int md_tunbin_ht_del(const void *vtunbin);

/* Whether the ID has a tunnel. */
OV_API tbool md_tunbin_ht_id_has_tunnel(uint32 tid);

/* The name of the ID's tunnel, borrowed until the ID is added or deleted; null when it has none. */
OV_API const char *md_tunbin_ht_get_name_by_id(uint32 tid);

/* The ID that a name or an alias leads to; 65535 when it is unknown or ambiguous, and for null,
 * which is logged as an error. */
OV_API uint32 md_tunbin_ht_get_id_by_name(const char *name);
OV_API uint32 md_tunbin_ht_get_id_by_alias(const char *alias);

/* Writes the cache and both tables to the log. */
OV_API void md_tunbin_ht_dump(void);

/*
 * The two tables, one of names and one of aliases. The cache above keeps them; they are here for
 * those who look into it. Nobody else may write them.
 */
extern OV_API okv_assoc_entry_type tunname_assoc[OKV_ASSOC_SIZE];
extern OV_API okv_assoc_entry_type tunalias_assoc[OKV_ASSOC_SIZE];

/* Empties the table and seeds its hash. Returns 0. */
OV_API int tunbin_tunname_ht_init(void);
OV_API int tunbin_tunalias_ht_init(void);

/*
 * Records that a text, which is not null, leads to an ID. One that leads to another ID already is
 * marked ambiguous, and stays so until it is deleted. An ID of 65535 records nothing for a text
 * that is not there, and a full table takes no further text: it stays unknown, which is logged.
 */
OV_API void tunbin_tunname_ht_add(char *name, uint32 id);
OV_API void tunbin_tunalias_ht_add(char *alias, uint32 id);

/* Forgets a text, ambiguous or not; it is not null. */
OV_API void tunbin_tunname_ht_del(char *name);
OV_API void tunbin_tunalias_ht_del(char *alias);

/*
 * The ID that a text, which is not null, leads to. `tid` may be null; it is left alone when the
 * text leads nowhere.
 * Returns 0; 14004 when the text is unknown or ambiguous.
 */
OV_NODISCARD OV_API int tunbin_tunname_ht_find(const char *name, uint32 *tid);
OV_NODISCARD OV_API int tunbin_tunalias_ht_find(const char *alias, uint32 *tid);

/* Writes the entries to the log and answers how many there are. */
OV_API uint32 tunbin_tunname_ht_dump(void);
OV_API uint32 tunbin_tunalias_ht_dump(void);

OV_C_END

#endif
