// Reads of nodes that fail while a commit is checked: a guard that cannot look must not take it
// that nobody uses a thing. The program's own queries of the database pass here (the linker wraps
// them); the library's are its own tests' business.

#include "framework/errors.h"
#include "host/modules/interface_lookup.h"
#include "host/modules/interface_nodes.h"
#include "host/modules/map_lookup.h"
#include "tests/mgmtd/map_fixture.h"

#include <functional>
#include <stdexcept>

namespace
{

unsigned reads = 0;
unsigned failing_read = 0; ///< counted from 1; 0: none

bool strikes()
{
    return ++reads == failing_read;
}

} // namespace

extern "C" {

int __real_mdb_get_node_value_tstr(md_commit *commit, const mdb_db *db, const char *name,
                                   uint32 options, void *further, tstring **ret);
int __real_mdb_get_node_binding(md_commit *commit, const mdb_db *db, const char *name,
                                uint32 options, bn_binding **ret);
int __real_mdb_get_tstr_array(md_commit *commit, const mdb_db *db, const char *parent,
                              uint32 options1, uint32 options2, uint32 options3, tstr_array **ret);
int __real_mdb_get_matching_tstr_array(md_commit *commit, const mdb_db *db, const char *pattern,
                                       uint32 options, tstr_array **ret);

int __wrap_mdb_get_node_value_tstr(md_commit *commit, const mdb_db *db, const char *name,
                                   uint32 options, void *further, tstring **ret)
{
    return strikes() ? lc_err_generic_error
                     : __real_mdb_get_node_value_tstr(commit, db, name, options, further, ret);
}

int __wrap_mdb_get_node_binding(md_commit *commit, const mdb_db *db, const char *name,
                                uint32 options, bn_binding **ret)
{
    return strikes() ? lc_err_generic_error
                     : __real_mdb_get_node_binding(commit, db, name, options, ret);
}

int __wrap_mdb_get_tstr_array(md_commit *commit, const mdb_db *db, const char *parent,
                              uint32 options1, uint32 options2, uint32 options3, tstr_array **ret)
{
    return strikes()
               ? lc_err_generic_error
               : __real_mdb_get_tstr_array(commit, db, parent, options1, options2, options3, ret);
}

int __wrap_mdb_get_matching_tstr_array(md_commit *commit, const mdb_db *db, const char *pattern,
                                       uint32 options, tstr_array **ret)
{
    return strikes() ? lc_err_generic_error
                     : __real_mdb_get_matching_tstr_array(commit, db, pattern, options, ret);
}

} // extern "C"

namespace
{

using namespace ovhost;
using namespace mgmtd_test;
using testing::HasSubstr;

const std::string wccp_interface = "/ov/wccpd/wccp/srv_grp/config/10/interface";

class ReadFaults : public MapTest
{
  protected:
    ReadFaults()
    {
        add_acl("used");
        add_acl("free");
        add_entry("m1", "10", "used");
        set("/ov/iflabels/config/lan/office", "1");
        set(rmap("m1/prio/20/match/0/matchstr"), "vlan:office");
        set(interface_record("eth0"), "eth0");
        set(wccp_interface, "eth0");
        EXPECT_EQ(commit(), "committed");
    }
    ReadFaults(const ReadFaults &) = delete;
    ReadFaults &operator=(const ReadFaults &) = delete;
    ~ReadFaults() override { failing_read = 0; }

    /// Commits an edit again and again, with the first read failing, with the second, and so on:
    /// every time it is refused, and nothing is changed. What is then said without a fault.
    std::string commit_through_faults(const std::function<void()> &edit)
    {
        const std::vector<std::string> before = nodes_of(configuration_->running());
        for (unsigned at = 1;; ++at) {
            edit();
            reads = 0;
            failing_read = at;
            const std::string outcome = commit();
            failing_read = 0;
            if (reads < at) {
                EXPECT_GT(at, 2U) << "there are reads to fail";
                return outcome;
            }
            EXPECT_THAT(outcome, HasSubstr("error code 14000")) << "read " << at;
            EXPECT_EQ(nodes_of(configuration_->running()), before) << "read " << at;
            configuration_->discard();
        }
    }
};

TEST_F(ReadFaults, LetNoUsedAclGo)
{
    EXPECT_THAT(commit_through_faults([this] { erase(acl("used")); }),
                HasSubstr("Used by route-map m1, entry 10."));
}

TEST_F(ReadFaults, LetNoUsedLabelGo)
{
    EXPECT_THAT(commit_through_faults([this] { erase("/ov/iflabels/config/lan/office"); }),
                HasSubstr("Please remove vlan:office from route-map m1, entry 20 first."));
}

TEST_F(ReadFaults, LetNoUsedInterfaceGo)
{
    EXPECT_THAT(commit_through_faults([this] { erase(interface_record("eth0")); }),
                HasSubstr("Cannot delete an interface when used by wccp group 10"));
}

TEST_F(ReadFaults, RefuseWhatWouldBeAllowed)
{
    EXPECT_EQ(commit_through_faults([this] {
                  erase(acl("free"));
                  set(rmap("m1/prio/30/match/0/acl"), "used");
                  erase(rmap("m1/prio/20"));
              }),
              "committed");
}

TEST_F(ReadFaults, NameTheNodeAndTheCode)
{
    reads = 0;
    failing_read = 1;
    try {
        (void)list_acls(configuration_->running_db());
        FAIL();
    } catch (const std::runtime_error &error) {
        EXPECT_STREQ(error.what(),
                     "cannot list the nodes of /ov/tunneld/acl/config: error code 14000");
    }
    reads = 0;
    set(acl("new"), "new");
    const std::string refusal = commit_in_vain();
    EXPECT_EQ(refusal,
              acl("new") + ": cannot read " + acl("new") + ": error code 14000 (schema)\n");
}

// Whoever asks gets an error, and not half the answer.
TEST_F(ReadFaults, FailQuestions)
{
    const mdb_db *const db = configuration_->running_db();
    const std::function<void()> questions[] = {
        [db] { (void)list_maps(db); },       [db] { (void)find_acl(db, "used"); },
        [db] { (void)list_acls(db); },       [db] { (void)check_references(db); },
        [db] { (void)list_interfaces(db); },
    };
    for (const auto &ask : questions) {
        reads = 0;
        ask();
        const unsigned all = reads;
        EXPECT_GT(all, 0U);
        for (unsigned at = 1; at <= all; ++at) {
            reads = 0;
            failing_read = at;
            EXPECT_THROW(ask(), std::runtime_error) << at;
        }
        failing_read = 0;
    }
}

} // namespace
