// The dynamic limits file, regenerated from a database.
#include "orvale/md_dyna_limits.h"

#include "framework/appliance.h"
#include "framework/bail.h"
#include "libovmd/frame/owners.h"

#include <cstdio>
#include <unistd.h>

using namespace ovmd;

static const char bail_unit[] = "md_dyna_limits";

namespace
{

constexpr char limits_path[] = "/var/opt/tms/dynalimits.conf";

struct limit_line {
    const char *node;
    const char *key;
};

constexpr limit_line limit_lines[] = {
    {"/ov/tunneld/system/config/limits/mem_size", "expected_mem"},
    {"/ov/tunneld/system/config/limits/system_bw", "max_def_bw"},
    {"/ov/tunneld/system/config/limits/total_flows", "max_loc_flows"},
    {"/ov/tunneld/system/config/limits/cifs_flows", "max_cifs_conns"},
    {"/ov/tunneld/system/config/limits/ssl_flows", "max_ssl_flows"},
    {"/ov/tunneld/system/config/limits/nm_ram_size", "nm_ram_size"},
};

// The file while it is being written. Readers find all lines or no file: unless finish() succeeds,
// the path is removed.
class limits_file
{
  public:
    limits_file()
    {
        (void)unlink(limits_path);
        file_ = fopen(limits_path, "w");
    }
    limits_file(const limits_file &) = delete;
    limits_file &operator=(const limits_file &) = delete;
    ~limits_file()
    {
        (void)close();
        if (!complete_) {
            (void)unlink(limits_path);
        }
    }

    FILE *get() const { return file_; }

    // Lines are buffered: that the disk is full may show only here.
    int finish()
    {
        const bool written = ferror(file_) == 0;
        complete_ = close() == 0 && written;
        return complete_ ? 0 : lc_err_io_error;
    }

  private:
    int close()
    {
        const int result = file_ != nullptr ? fclose(file_) : 0;
        file_ = nullptr;
        return result;
    }

    FILE *file_ = nullptr;
    bool complete_ = false;
};

// An absent node leaves the limit alone; reports in `function`'s name.
int read_limit(const char *function, const mdb_db *db, const char *node, uint32 &ret_limit)
{
    owned_binding binding;
    BAIL_ERROR_FOR(function, mdb_get_node_binding(nullptr, db, node, 0, binding.out()));
    if (binding.get() != nullptr) {
        BAIL_ERROR_FOR(function, bn_binding_get_uint32(binding.get(), ba_value, 0, &ret_limit));
    }
    return 0;
}

} // namespace

int write_dyna_limits_conf(const mdb_db *new_db)
{
    BAIL_NULL(new_db);
    if (ov_system_info.initialized == 0) {
        BAIL_ERROR(init_model_info(new_db));
    }

    limits_file file;
    BAIL_NULL(file.get());
    for (const limit_line &line : limit_lines) {
        uint32 limit = 0;
        const int err = read_limit(__func__, new_db, line.node, limit);
        if (err != 0) {
            return err;
        }
        // The format is signed: a limit beyond its range stands there as a negative number.
        (void)fprintf(file.get(), "%s %d\n", line.key, static_cast<int32>(limit));
    }
    BAIL_ERROR(file.finish());
    return 0;
}
