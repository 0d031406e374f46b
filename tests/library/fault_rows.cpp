#include "tests/library/fault_rows.h"

namespace ovtest
{

std::vector<FaultRow> application_rows();
std::vector<FaultRow> interface_rows();
std::vector<FaultRow> md_db_default_rows();
std::vector<FaultRow> md_dyna_limits_rows();
std::vector<FaultRow> md_event_common_rows();
std::vector<FaultRow> md_tunbin_ht_rows();
std::vector<FaultRow> md_tunneld_tunnel_common_rows();
std::vector<FaultRow> md_utils_rows();
std::vector<FaultRow> route_rows();
std::vector<FaultRow> tunnel_id_rows();
std::vector<FaultRow> xmap_checks_rows();
std::vector<FaultRow> xmap_match_rows();
std::vector<FaultRow> xmap_upgrade_rows();

const std::vector<FaultRow> &fault_rows()
{
    static const std::vector<FaultRow> all = [] {
        std::vector<FaultRow> rows;
        for (const auto rows_of_unit :
             {md_db_default_rows, md_dyna_limits_rows, md_event_common_rows, md_tunbin_ht_rows,
              md_tunneld_tunnel_common_rows, tunnel_id_rows, xmap_checks_rows, xmap_match_rows,
              xmap_upgrade_rows, application_rows, interface_rows, md_utils_rows, route_rows}) {
            for (FaultRow &row : rows_of_unit()) {
                rows.push_back(std::move(row));
            }
        }
        return rows;
    }();
    return all;
}

} // namespace ovtest
