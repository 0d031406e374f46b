#include "orvale/md_tunbin_ht.h"

#include "tests/library/library_test.h"
#include "tests/library/literal_table.h"
#include "tests/library/tunnel_cache.h"

using namespace ovtest;
using testing::AllOf;
using testing::ElementsAre;
using testing::HasSubstr;
using testing::IsEmpty;
using testing::StartsWith;

namespace
{

class TunnelCache : public LibraryTest
{
  protected:
    TunnelCache()
    {
        (void)md_tunbin_ht_init();
        host_.set_log_level(5);
    }

    // From now on everything is logged, and what has been is forgotten.
    void log_everything()
    {
        host_.set_log_level(7);
        forget_calls();
    }

    static int add(const std::string &name, const std::string &alias, uint32 id)
    {
        const tunnel_config_bin_t record = record_of(name, alias, id);
        return in_library(md_tunbin_ht_add, &record);
    }
    static int del(const std::string &name, const std::string &alias, uint32 id)
    {
        const tunnel_config_bin_t record = record_of(name, alias, id);
        return in_library(md_tunbin_ht_del, &record);
    }
    static bool has(uint32 id) { return in_library(md_tunbin_ht_id_has_tunnel, id); }
    static std::string name(uint32 id)
    {
        const char *const text = in_library(md_tunbin_ht_get_name_by_id, id);
        return text != nullptr ? text : "null";
    }
    static uint32 by_name(const std::string &name)
    {
        return in_library(md_tunbin_ht_get_id_by_name, name.c_str());
    }
    static uint32 by_alias(const std::string &alias)
    {
        return in_library(md_tunbin_ht_get_id_by_alias, alias.c_str());
    }

    static std::string key_of(const TableOperations &table, const std::string &text)
    {
        const LiteralKey key = literal_key(text, seed_of(table));
        return key_text(key.high, key.low);
    }
};

TEST_F(TunnelCache, IsEmptyAfterItsInit)
{
    EXPECT_EQ(add("t1", "a1", 7), 0);
    EXPECT_EQ(in_library(md_tunbin_ht_init), 0);
    EXPECT_FALSE(has(7));
    EXPECT_FALSE(has(0));
    EXPECT_EQ(name(7), "null");
    EXPECT_EQ(by_name("t1"), 65535U);
    EXPECT_EQ(by_alias("a1"), 65535U);
}

TEST_F(TunnelCache, SaysThatItIsInitialised)
{
    log_everything();
    EXPECT_EQ(in_library(md_tunbin_ht_init), 0);
    const auto table_line = [](const char *function) {
        return StartsWith(
            gated_line(6, std::string(" ") + function + ": OKVSZ:2097152 sizeof:2097152 assoc:0x"));
    };
    EXPECT_THAT(log_lines(), ElementsAre(gated_line(6, "md_tunbin_ht_init: ENTRY"),
                                         table_line("tunbin_tunname_ht_init"),
                                         table_line("tunbin_tunalias_ht_init"),
                                         gated_line(6, "md_tunbin_ht_init: Done")));
}

TEST_F(TunnelCache, LeadsBetweenIdNameAndAlias)
{
    EXPECT_EQ(add("t1", "a1", 7), 0);
    EXPECT_TRUE(has(7));
    EXPECT_EQ(name(7), "t1");
    EXPECT_EQ(by_name("t1"), 7U);
    EXPECT_EQ(by_alias("a1"), 7U);
    EXPECT_EQ(by_name("a1"), 65535U);
    EXPECT_EQ(by_alias("t1"), 65535U);
    EXPECT_FALSE(has(6));
    EXPECT_FALSE(has(8));
}

TEST_F(TunnelCache, SaysWhatItAdds)
{
    const std::string name_key = key_of(table_operations[0], "t1");
    const std::string alias_key = key_of(table_operations[1], "a1");
    log_everything();
    EXPECT_EQ(add("t1", "a1", 7), 0);
    // The field labelled alias shows the name.
    EXPECT_THAT(
        log_lines(),
        ElementsAre(
            gated_line(6, "tunbin_tunname_ht_add: ADDED tunname t1 key=" + name_key + ", tid:7"),
            gated_line(6, "tunbin_tunalias_ht_add: ADDED tunalias a1 key=" + alias_key + ", tid:7"),
            gated_line(6, "md_tunbin_ht_add: added name=t1/alias=t1/id=7 to mgmt tun cache")));
}

TEST_F(TunnelCache, SaysWhatItAddsOfANameThatAnotherHas)
{
    EXPECT_EQ(add("t1", "a1", 7), 0);
    const std::string name_key = key_of(table_operations[0], "t1");
    const std::string alias_key = key_of(table_operations[1], "a2");
    log_everything();
    EXPECT_EQ(add("t1", "a2", 8), 0);
    EXPECT_THAT(
        log_lines(),
        ElementsAre(
            gated_line(3, "tunbin_tunname_ht_add: CONFLICT tunname t1 key=" + name_key + ", tid:8"),
            gated_line(6, "tunbin_tunalias_ht_add: ADDED tunalias a2 key=" + alias_key + ", tid:8"),
            gated_line(6, "md_tunbin_ht_add: added name=t1/alias=t1/id=8 to mgmt tun cache")));
}

TEST_F(TunnelCache, SaysWhatItAddsOfAnAliasThatAnotherHas)
{
    EXPECT_EQ(add("t1", "a1", 7), 0);
    const std::string name_key = key_of(table_operations[0], "t2");
    const std::string alias_key = key_of(table_operations[1], "a1");
    log_everything();
    EXPECT_EQ(add("t2", "a1", 8), 0);
    EXPECT_THAT(
        log_lines(),
        ElementsAre(
            gated_line(6, "tunbin_tunname_ht_add: ADDED tunname t2 key=" + name_key + ", tid:8"),
            gated_line(3,
                       "tunbin_tunalias_ht_add: CONFLICT tunalias a1 key=" + alias_key + ", tid:8"),
            gated_line(6, "md_tunbin_ht_add: added name=t2/alias=t2/id=8 to mgmt tun cache")));
}

TEST_F(TunnelCache, ForgetsATunnel)
{
    EXPECT_EQ(add("t1", "a1", 7), 0);
    log_everything();
    EXPECT_EQ(del("t1", "a1", 7), 0);
    EXPECT_THAT(log_lines(),
                ElementsAre(gated_line(
                    6, "md_tunbin_ht_del: removed name=t1/alias=t1/id=7 from mgmt cache")));
    forget_calls();
    EXPECT_FALSE(has(7));
    EXPECT_EQ(name(7), "null");
    EXPECT_EQ(by_name("t1"), 65535U);
    EXPECT_EQ(by_alias("a1"), 65535U);
    EXPECT_THAT(log_lines(), IsEmpty());
}

TEST_F(TunnelCache, ForgettingGoesByTheRecordThatIsPassed)
{
    EXPECT_EQ(add("t1", "a1", 7), 0);
    EXPECT_EQ(add("t2", "a2", 8), 0);
    EXPECT_EQ(del("t2", "a1", 7), 0);
    EXPECT_FALSE(has(7));
    EXPECT_EQ(by_name("t1"), 7U);
    EXPECT_EQ(by_alias("a1"), 65535U);
    EXPECT_EQ(name(8), "t2");
    EXPECT_EQ(by_name("t2"), 65535U);
    EXPECT_EQ(by_alias("a2"), 8U);
}

TEST_F(TunnelCache, ForgettingWhatIsNotThereIsNoError)
{
    const std::string name_key = key_of(table_operations[0], "t1");
    const std::string alias_key = key_of(table_operations[1], "a1");
    log_everything();
    EXPECT_EQ(del("t1", "a1", 7), 0);
    EXPECT_THAT(
        log_lines(),
        ElementsAre(
            gated_line(6, "tunbin_tunname_ht_del: could not remove tun=t1 from hash table. key=" +
                              name_key),
            gated_line(6, "tunbin_tunalias_ht_del: could not remove tun=a1 from hash table. key=" +
                              alias_key),
            gated_line(6, "md_tunbin_ht_del: removed name=t1/alias=t1/id=7 from mgmt cache")));
}

TEST_F(TunnelCache, TheFirstAndTheLastId)
{
    EXPECT_EQ(add("t1", "a1", 0), 0);
    EXPECT_EQ(add("t2", "a2", 10021), 0);
    EXPECT_TRUE(has(0));
    EXPECT_TRUE(has(10021));
    EXPECT_EQ(name(10021), "t2");
    EXPECT_EQ(by_name("t1"), 0U);
    EXPECT_EQ(del("t2", "a2", 10021), 0);
    EXPECT_FALSE(has(10021));
}

TEST_F(TunnelCache, RefusesToAddIdsPastTheLast)
{
    const auto refusal = [](const std::string &id) {
        return error_line("md_tunbin_ht", "md_tunbin_ht_add",
                          "md_tunbin_ht_add: tunbin has invalid tunnel id " + id);
    };
    log_everything();
    EXPECT_EQ(add("t1", "a1", 10022), 14000);
    EXPECT_EQ(add("t1", "a1", 65535), 14000);
    EXPECT_EQ(add("t1", "a1", 4294967295), 14000);
    EXPECT_THAT(log_lines(), ElementsAre(refusal("10022"), refusal("65535"), refusal("-1")));
    EXPECT_EQ(num_calls(Operation::bail_debug), 3U);
    EXPECT_FALSE(has(10022));
    EXPECT_FALSE(has(65535));
    EXPECT_EQ(by_name("t1"), 65535U);
    EXPECT_EQ(by_alias("a1"), 65535U);
}

TEST_F(TunnelCache, RefusesToForgetIdsPastTheLast)
{
    EXPECT_EQ(add("t1", "a1", 7), 0);
    log_everything();
    EXPECT_EQ(del("t1", "a1", 10022), 14000);
    EXPECT_THAT(log_lines(),
                ElementsAre(error_line("md_tunbin_ht", "md_tunbin_ht_del",
                                       "md_tunbin_ht_del: tunbin has invalid tunnel id 10022")));
    EXPECT_EQ(num_calls(Operation::bail_debug), 1U);
    EXPECT_EQ(by_name("t1"), 7U);
    EXPECT_EQ(by_alias("a1"), 7U);
}

// The line is written whatever the threshold: the host decides about it.
TEST_F(TunnelCache, ARefusalIsNotGated)
{
    host_.set_log_level(0);
    EXPECT_EQ(add("t1", "a1", 10022), 14000);
    EXPECT_EQ(log_lines().size(), 1U);
}

TEST_F(TunnelCache, ANullRecordIsNothingToDo)
{
    log_everything();
    EXPECT_EQ(in_library(md_tunbin_ht_add, nullptr), 0);
    EXPECT_EQ(in_library(md_tunbin_ht_del, nullptr), 0);
    EXPECT_THAT(log_lines(), IsEmpty());
}

TEST_F(TunnelCache, TheNameOfAnInvalidIdIsAnError)
{
    log_everything();
    EXPECT_EQ(name(20000), "null");
    EXPECT_EQ(name(10022), "null");
    EXPECT_EQ(name(10021), "null");
    EXPECT_THAT(log_lines(),
                ElementsAre(gated_line(3, "md_tunbin_ht_get_name_by_id: invalid tunnel id 20000"),
                            gated_line(3, "md_tunbin_ht_get_name_by_id: invalid tunnel id 10022")));
    EXPECT_EQ(num_calls(Operation::bail_debug), 0U);
}

TEST_F(TunnelCache, AnInvalidIdHasNoTunnelAndThatIsNoError)
{
    log_everything();
    for (const uint32 id : {10022U, 65535U, 4294967295U}) {
        EXPECT_FALSE(has(id));
    }
    EXPECT_THAT(log_lines(), IsEmpty());
    EXPECT_EQ(num_calls(Operation::bail_debug), 0U);
}

TEST_F(TunnelCache, NullLeadsToNoneAndIsAnError)
{
    log_everything();
    EXPECT_EQ(in_library(md_tunbin_ht_get_id_by_name, nullptr), 65535U);
    EXPECT_EQ(in_library(md_tunbin_ht_get_id_by_alias, nullptr), 65535U);
    EXPECT_THAT(
        log_lines(),
        ElementsAre(error_line("md_tunbin_ht", "md_tunbin_ht_get_id_by_name", "Unexpected NULL"),
                    error_line("md_tunbin_ht", "md_tunbin_ht_get_id_by_alias", "Unexpected NULL")));
    EXPECT_EQ(num_calls(Operation::bail_debug), 2U);
}

TEST_F(TunnelCache, AnAliasOfTwoTunnelsLeadsToNone)
{
    EXPECT_EQ(add("t1", "a", 7), 0);
    EXPECT_EQ(add("t2", "a", 8), 0);
    EXPECT_EQ(by_alias("a"), 65535U);
    EXPECT_EQ(by_name("t1"), 7U);
    EXPECT_EQ(by_name("t2"), 8U);
    // When one goes the alias leads to none still, until the other is added again.
    EXPECT_EQ(del("t1", "a", 7), 0);
    EXPECT_EQ(by_alias("a"), 65535U);
    EXPECT_EQ(add("t2", "a", 8), 0);
    EXPECT_EQ(by_alias("a"), 8U);
}

TEST_F(TunnelCache, EmptyTextsAreTextsToo)
{
    EXPECT_EQ(add("", "", 7), 0);
    EXPECT_TRUE(has(7));
    EXPECT_EQ(name(7), "");
    EXPECT_EQ(by_name(""), 7U);
    EXPECT_EQ(by_alias(""), 7U);
    EXPECT_EQ(add("t2", "", 8), 0);
    EXPECT_EQ(by_alias(""), 65535U);
}

TEST_F(TunnelCache, AnIdThatIsAddedAgainKeepsItsOldNameToo)
{
    EXPECT_EQ(add("t1", "a1", 7), 0);
    EXPECT_EQ(add("t2", "a2", 7), 0);
    EXPECT_EQ(name(7), "t2");
    EXPECT_EQ(by_name("t1"), 7U);
    EXPECT_EQ(by_name("t2"), 7U);
    EXPECT_EQ(by_alias("a1"), 7U);
    EXPECT_EQ(by_alias("a2"), 7U);
}

TEST_F(TunnelCache, AShorterNameLeavesNothingOfALongerOne)
{
    EXPECT_EQ(add("a long name", "a1", 7), 0);
    EXPECT_EQ(add("t", "a1", 7), 0);
    EXPECT_EQ(name(7), "t");
}

TEST_F(TunnelCache, TheLongestTexts)
{
    const std::string longest_name(64, 'n');
    const std::string longest_alias(255, 'a');
    EXPECT_EQ(add(longest_name, longest_alias, 7), 0);
    EXPECT_EQ(name(7), longest_name);
    EXPECT_EQ(by_name(longest_name), 7U);
    EXPECT_EQ(by_alias(longest_alias), 7U);
    log_everything();
    in_library(md_tunbin_ht_dump);
    EXPECT_THAT(log_lines()[1], gated_line(6, "md_tunbin_ht_dump_tun_cache: tunnel id 7 - name=" +
                                                  longest_name + ", alias=" + longest_alias));
}

// A host that fills its fields to the last byte gets them cut, not read on into what is behind.
TEST_F(TunnelCache, TextsWithoutAnEndAreCut)
{
    EXPECT_EQ(add(std::string(300, 'n'), std::string(300, 'a'), 7), 0);
    EXPECT_EQ(name(7), std::string(64, 'n'));
    EXPECT_EQ(by_name(std::string(64, 'n')), 7U);
    EXPECT_EQ(by_name(std::string(65, 'n')), 65535U);
    EXPECT_EQ(by_alias(std::string(255, 'a')), 7U);
    EXPECT_EQ(del(std::string(65, 'n'), std::string(256, 'a'), 7), 0);
    EXPECT_EQ(by_name(std::string(64, 'n')), 65535U);
    EXPECT_EQ(by_alias(std::string(255, 'a')), 65535U);
}

TEST_F(TunnelCache, ANameIsTheCachesOwn)
{
    tunnel_config_bin_t record = record_of("t1", "a1", 7);
    EXPECT_EQ(in_library(md_tunbin_ht_add, &record), 0);
    record.tp_tunnel_name[0] = 'x';
    EXPECT_EQ(name(7), "t1");
}

TEST_F(TunnelCache, IsDumpedInTheOrderOfIdsWithBothTables)
{
    EXPECT_EQ(add("t2", "a", 10021), 0);
    EXPECT_EQ(add("t1", "a", 3), 0);
    EXPECT_EQ(add("t3", "b", 5), 0);
    EXPECT_EQ(del("t3", "b", 5), 0);
    const std::string alias_key = key_of(table_operations[1], "a");
    log_everything();
    in_library(md_tunbin_ht_dump);
    // "t1" and "t2" stand side by side in an order that the seed decides.
    const auto name_line = [](const char *function) {
        return AllOf(StartsWith(gated_line(6, std::string(function) + ": key=")),
                     HasSubstr(", count=1"));
    };
    EXPECT_THAT(
        log_lines(),
        ElementsAre(
            gated_line(6, "md_tunbin_ht_dump: dumping tunnel name/alias/id cache"),
            gated_line(6, "md_tunbin_ht_dump_tun_cache: tunnel id 3 - name=t1, alias=a"),
            gated_line(6, "md_tunbin_ht_dump_tun_cache: tunnel id 10021 - name=t2, alias=a"),
            gated_line(6, "md_tunbin_ht_dump: dumping tunnel name hash table"),
            name_line("tunbin_tunname_ht_dump"), name_line("tunbin_tunname_ht_dump"),
            gated_line(6, "tunbin_tunname_ht_dump: total 2 entries dumped"),
            gated_line(6, "md_tunbin_ht_dump: dumping tunnel alias hash table"),
            gated_line(6, "tunbin_tunalias_ht_dump: key=" + alias_key + ", value=65534, count=1"),
            gated_line(6, "tunbin_tunalias_ht_dump: total 1 entries dumped")));
}

// The slot of an ID, through the only pointer into it that is handed out.
uint32 *id_in_slot(uint32 id)
{
    const char *const name = md_tunbin_ht_get_name_by_id(id);
    return reinterpret_cast<uint32 *>(const_cast<char *>(name) - sizeof(uint32));
}

TEST_F(TunnelCache, ADamagedSlotShowsInTheDump)
{
    EXPECT_EQ(add("t1", "a1", 7), 0);
    *id_in_slot(7) = 9;
    EXPECT_FALSE(has(7));
    EXPECT_EQ(name(7), "null");
    forget_calls();
    // More urgent than the listing: it shows where the listing does not.
    in_library(md_tunbin_ht_dump);
    EXPECT_THAT(log_lines(), ElementsAre(gated_line(
                                 5, "md_tunbin_ht_dump_tun_cache: WRONG INDEX - tunnel id 9 at "
                                    "index position 7")));
}

} // namespace
