#include "host/modules/change_events.h"

#include "host/framework/sessions.h"
#include "host/modules/node_access.h"
#include "tests/mgmtd/fixture.h"

namespace
{

using namespace ovhost;
using namespace mgmtd_test;
using testing::ElementsAre;
using testing::IsEmpty;

/// A peer that notes what it is sent: "TYPE VALUE" of each binding behind the binding's name.
class NotingSession : public gcl_session
{
  public:
    NotingSession() { register_session("jsond", *this); }
    ~NotingSession() override { unregister_session("jsond", *this); }

    bool send(const bn_request &request) override
    {
        std::string event = request.event_name;
        for (const bn_binding &binding : request.bindings) {
            const Value &value = binding.attribs.attribs.at(ba_value);
            event += "\n" + binding.name + " " + type_name(value.type) + " " + value.text;
        }
        events.push_back(event);
        return true;
    }

    std::vector<std::string> events;
};

class ChangeEvents : public DaemonTest
{
  protected:
    ChangeEvents() { configuration_.start(); }

    void set(const std::string &name, bn_type type, const std::string &text)
    {
        ASSERT_EQ(configuration_.candidate().set(name, type, text), std::nullopt);
    }

    Configuration configuration_{state_.path()};
};

TEST_F(ChangeEvents, TellOfEachKindOfChangeInTheOrderOfNames)
{
    set("/x/gone", bt_string, "old");
    set("/x/kept", bt_uint8, "1");
    ASSERT_TRUE(configuration_.commit(daemon_note("")).accepted());
    NotingSession jsond;
    set("/x/new", bt_ipv4addr, "192.0.2.1");
    set("/x/kept", bt_uint8, "2");
    ASSERT_EQ(configuration_.candidate().erase("/x/gone"), std::nullopt);
    ASSERT_TRUE(configuration_.commit(daemon_note("")).accepted());
    EXPECT_THAT(jsond.events,
                ElementsAre("/mgmtd/notify/dbchange\n"
                            "/mgmtd/notification/dbchange/0/change_type string delete\n"
                            "/mgmtd/notification/dbchange/0 uint32 0\n"
                            "/mgmtd/notification/dbchange/0/name name /x/gone\n"
                            "/mgmtd/notification/dbchange/0/prev_attribs/value string old",
                            "/mgmtd/notify/dbchange\n"
                            "/mgmtd/notification/dbchange/0/change_type string modify\n"
                            "/mgmtd/notification/dbchange/0 uint32 0\n"
                            "/mgmtd/notification/dbchange/0/name name /x/kept\n"
                            "/mgmtd/notification/dbchange/0/new_attribs/value string 2\n"
                            "/mgmtd/notification/dbchange/0/prev_attribs/value string 1",
                            "/mgmtd/notify/dbchange\n"
                            "/mgmtd/notification/dbchange/0/change_type string add\n"
                            "/mgmtd/notification/dbchange/0 uint32 0\n"
                            "/mgmtd/notification/dbchange/0/name name /x/new\n"
                            "/mgmtd/notification/dbchange/0/new_attribs/value string 192.0.2.1"));
}

TEST_F(ChangeEvents, KeepNamesEscaped)
{
    NotingSession jsond;
    set("/x/10.0.0.0\\/8", bt_string, "");
    ASSERT_TRUE(configuration_.commit(daemon_note("")).accepted());
    EXPECT_THAT(jsond.events,
                ElementsAre("/mgmtd/notify/dbchange\n"
                            "/mgmtd/notification/dbchange/0/change_type string add\n"
                            "/mgmtd/notification/dbchange/0 uint32 0\n"
                            "/mgmtd/notification/dbchange/0/name name /x/10.0.0.0\\/8\n"
                            "/mgmtd/notification/dbchange/0/new_attribs/value string "));
}

TEST_F(ChangeEvents, DoNotTellOfWhatDidNotHappen)
{
    NotingSession jsond;
    set("/x/a", bt_string, "1");
    (void)configuration_.check();
    set("/ov/tunneld/system/config/mode", bt_string, "x");
    EXPECT_EQ(configuration_.commit(daemon_note("")).outcome, CommitOutcome::refused);
    configuration_.discard();
    EXPECT_EQ(configuration_.commit(daemon_note("")).outcome, CommitOutcome::unchanged);
    EXPECT_THAT(jsond.events, IsEmpty());
}

TEST_F(ChangeEvents, AreLoggedWhenThereIsNoPeer)
{
    set("/x/a", bt_string, "1");
    log_.lines.clear();
    ASSERT_TRUE(configuration_.commit(daemon_note("")).accepted());
    std::vector<std::string> texts;
    for (const auto &line : log_.lines) {
        texts.push_back(std::to_string(line.level) + " " + line.text);
    }
    EXPECT_THAT(texts, ElementsAre("5 commit 2 is in force: 1 change",
                                   "5 Cannot send event to jsond as jsond_session is null",
                                   "5 DBC event sent: param=/x/a, old=(null), new=1"));
}

TEST(ChangeEventsModule, SkipsWhatIsNotToBeAnnounced)
{
    ovhost::test::LogCapture log;
    NotingSession jsond;
    tstring quiet_name{"/x/quiet"};
    tstring name{"/x/told"};
    const auto borrowed = [](mdb_db_change *) {};
    mdb_db_change quiet{&quiet_name, nullptr, mdct_add, true, nullptr, nullptr};
    mdb_db_change told{&name, nullptr, mdct_delete, false, nullptr, nullptr};
    mdb_db_change_array changes;
    changes.changes.emplace_back(&quiet, borrowed);
    changes.changes.emplace_back(nullptr, borrowed);
    changes.changes.emplace_back(&told, borrowed);
    ChangeEventsModule().notify(&changes);
    EXPECT_THAT(jsond.events,
                ElementsAre("/mgmtd/notify/dbchange\n"
                            "/mgmtd/notification/dbchange/0/change_type string delete\n"
                            "/mgmtd/notification/dbchange/0 uint32 0\n"
                            "/mgmtd/notification/dbchange/0/name name /x/told"));
}

} // namespace
