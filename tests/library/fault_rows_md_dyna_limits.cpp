#include "framework/appliance.h"
#include "orvale/md_dyna_limits.h"
#include "tests/library/fault_rows.h"

namespace ovtest
{

namespace
{

const UnitLines unit("md_dyna_limits");

constexpr char limits_file[] = "/var/opt/tms/dynalimits.conf";
constexpr char function[] = "write_dyna_limits_conf";

std::string write_limits(HostFixture &host)
{
    write_file(limits_file, "old");
    const int status = in_library(write_dyna_limits_conf, host.db());
    return std::to_string(status) + ' ' + read_file(limits_file).value_or("no file");
}

} // namespace

std::vector<FaultRow> md_dyna_limits_rows()
{
    const std::string limits = "0 expected_mem 7\nmax_def_bw 0\nmax_loc_flows 0\n"
                               "max_cifs_conns 0\nmax_ssl_flows 8\nnm_ram_size 0\n";
    const Outcome passed_up = {"{code} no file", {unit.bail(function)}};
    return {
        {function,
         "with_two_limits",
         [](HostFixture &host) {
             host.set("/ov/tunneld/system/config/limits/mem_size", bt_uint32, "7");
             host.set("/ov/tunneld/system/config/limits/ssl_flows", bt_uint32, "8");
         },
         write_limits,
         {limits},
         {{fails(Operation::init_model_info), {"{code} old", {unit.bail(function)}}},
          {fails(Operation::mdb_get_node_binding), passed_up},
          // The limit is taken for an absent one.
          {{Operation::mdb_get_node_binding, 1, When::Lasting::once, FaultWay::without_object},
           {"0 expected_mem 0\nmax_def_bw 0\nmax_loc_flows 0\nmax_cifs_conns 0\n"
            "max_ssl_flows 8\nnm_ram_size 0\n"}},
          {{Operation::mdb_get_node_binding, 1, When::Lasting::and_later, FaultWay::without_object},
           {"0 expected_mem 0\nmax_def_bw 0\nmax_loc_flows 0\nmax_cifs_conns 0\n"
            "max_ssl_flows 0\nnm_ram_size 0\n"}},
          {{Operation::mdb_get_node_binding, 6, When::Lasting::either, FaultWay::without_object},
           {limits}},
          {{Operation::mdb_get_node_binding, 5, When::Lasting::either, FaultWay::without_object},
           {"0 expected_mem 7\nmax_def_bw 0\nmax_loc_flows 0\nmax_cifs_conns 0\n"
            "max_ssl_flows 0\nnm_ram_size 0\n"}},
          {{Operation::mdb_get_node_binding, When::any_call, When::Lasting::once,
            FaultWay::without_object},
           {limits}},
          {hands_out_nothing(Operation::mdb_get_node_binding),
           {"0 expected_mem 7\nmax_def_bw 0\nmax_loc_flows 0\nmax_cifs_conns 0\n"
            "max_ssl_flows 0\nnm_ram_size 0\n"}},
          {fails(Operation::bn_binding_get_uint32), passed_up},
          // Without memory for the stream there is no file; without any for its buffer the lines
          // are written one by one.
          {fails(Operation::allocation, 1), {"14001 no file", {unit.unexpected_null(function)}}},
          {fails(Operation::allocation, 2), {limits}}}},
    };
}

} // namespace ovtest
