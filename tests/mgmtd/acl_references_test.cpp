// Records of references compared with maps: host/modules/acl_references.h.

#include "host/modules/acl_references.h"

#include "host/framework/objects.h"
#include "host/tree/name.h"
#include "tests/mgmtd/map_fixture.h"

namespace
{

using namespace ovhost;
using namespace mgmtd_test;
using testing::ElementsAre;
using testing::IsEmpty;

/// Nodes as they may have come to be in a store, whoever wrote them.
class References : public EveryMapKind
{
  protected:
    void put(const std::string &node, bn_type type, const std::string &text)
    {
        db_.tree.set(split_name(node).value(), {type, text});
    }

    void put_acl(const std::string &name) { put(acl(name), bt_string, name); }

    void put_entry(const std::string &priority, const std::string &acl_name)
    {
        put(match("m1", priority, "acl"), bt_string, acl_name);
    }

    void put_record(const std::string &acl_name, const std::string &priority)
    {
        put(record(acl_name, kind(), "m1", priority), bt_uint32, priority);
    }

    /// "ACL MAP PRIORITY: MESSAGE" for each fault.
    std::vector<std::string> faults() const
    {
        std::vector<std::string> texts;
        for (const ReferenceFault &fault : check_references(&db_).faults) {
            EXPECT_EQ(fault.entry.kind->type, kind().type);
            texts.push_back(fault.acl + " " + fault.entry.map + " " + fault.entry.priority + ": " +
                            fault.message);
        }
        return texts;
    }

    mdb_db db_;
};

INSTANTIATE_TEST_SUITE_P(Kinds, References, testing::ValuesIn(map_kinds), key_of);

TEST_P(References, AgreeWithTheMaps)
{
    EXPECT_THAT(faults(), IsEmpty());
    put_acl("a1");
    put_entry("10", "a1");
    put_entry("20", "a1");
    put_entry("30", "");
    put_record("a1", "10");
    put_record("a1", "20");
    EXPECT_THAT(faults(), IsEmpty());
    EXPECT_EQ(check_references(&db_).records, 2U);
    EXPECT_THAT(recorded_references(&db_, "a1"),
                ElementsAre(MapEntry{find_map_kind(kind().key), "m1", "10"},
                            MapEntry{find_map_kind(kind().key), "m1", "20"}));
    EXPECT_THAT(recorded_references(&db_, "a2"), IsEmpty());
}

TEST_P(References, MayBeMissing)
{
    put_acl("a1");
    put_entry("10", "a1");
    put_entry("20", "a2");
    EXPECT_THAT(faults(),
                ElementsAre("a1 m1 10: the entry names the ACL, but there is no record; delete " +
                                match("m1", "10", "acl") + ", commit, and set it again",
                            "a2 m1 20: the entry names the ACL, but there is no such ACL; delete " +
                                match("m1", "20", "acl") + ", commit, and set it again"));
}

TEST_P(References, MayBeStale)
{
    put_acl("a1");
    put_acl("a2");
    put_entry("20", "a2");
    put_record("a1", "10");
    put_record("a1", "20");
    put_record("a2", "20");
    EXPECT_THAT(faults(),
                ElementsAre("a1 m1 10: there is a record, but the entry names no ACL; delete " +
                                record("a1", kind(), "m1", "10"),
                            "a1 m1 20: there is a record, but the entry names ACL \"a2\"; delete " +
                                record("a1", kind(), "m1", "20")));
    EXPECT_EQ(check_references(&db_).records, 3U);
}

TEST_P(References, MayHoldSomethingElse)
{
    put_acl("a1");
    put_entry("10", "a1");
    put(record("a1", kind(), "m1", "10"), bt_uint32, "11");
    EXPECT_THAT(faults(), ElementsAre("a1 m1 10: the record does not hold the priority; delete " +
                                      match("m1", "10", "acl") + ", commit, and set it again"));
}

TEST_P(References, AreNotKeptOfTheDefaultEntry)
{
    put_acl("a1");
    put_entry("65535", "a1");
    EXPECT_THAT(faults(), IsEmpty());
    put_record("a1", "65535");
    EXPECT_THAT(faults(),
                ElementsAre("a1 m1 65535: there is a record, but the entry names no ACL; delete " +
                            record("a1", kind(), "m1", "65535")));
}

TEST_P(References, TellTheEntryThatTheyAreAbout)
{
    EXPECT_EQ(describe({find_map_kind(kind().key), "m1", "10"}),
              std::string(kind().name) + " m1, entry 10");
}

} // namespace
