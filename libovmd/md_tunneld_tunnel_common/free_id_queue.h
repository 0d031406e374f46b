// The records of the tunnel IDs, and the queue of the free ones: first freed, first offered, and
// any of them can be taken out of the middle.
#pragma once

#include "framework/tstring.h"

namespace ovmd
{

struct tunnel_id_info {
    struct {
        tunnel_id_info *next;
        tunnel_id_info **prev; // the link that points here; null while not in the queue
    } tailq_entry;
    tstring *name; // null while the ID is free
    uint16 id;
    uint64 last_use_ts; // when the ID was last freed, in milliseconds since boot; 0: never
};

class tunnel_id_info_q_t
{
  public:
    tunnel_id_info *first() const { return qh_first; }

    void clear()
    {
        qh_first = nullptr;
        qh_last = nullptr;
    }

    void append(tunnel_id_info &record)
    {
        tunnel_id_info **const last = qh_first != nullptr ? qh_last : &qh_first;
        record.tailq_entry.next = nullptr;
        record.tailq_entry.prev = last;
        *last = &record;
        qh_last = &record.tailq_entry.next;
    }

    // Does nothing to a record that is not in the queue: a rebinding that failed half-way leaves
    // an ID without a name and outside it.
    void remove(tunnel_id_info &record)
    {
        if (record.tailq_entry.prev == nullptr) {
            return;
        }
        *record.tailq_entry.prev = record.tailq_entry.next;
        if (record.tailq_entry.next != nullptr) {
            record.tailq_entry.next->tailq_entry.prev = record.tailq_entry.prev;
        } else {
            qh_last = record.tailq_entry.prev;
        }
        record.tailq_entry = {nullptr, nullptr};
    }

  private:
    tunnel_id_info *qh_first = nullptr;
    tunnel_id_info **qh_last = nullptr;
};

} // namespace ovmd
