// A long random sequence of operations on the tunnel ID allocator, beside a model of it.
#include "tests/library/library_test.h"
#include "tests/library/tunnel_ids.h"
#include "tests/support/sanitized.h"

#include <algorithm>
#include <list>
#include <ostream>
#include <random>
#include <set>
#include <utility>

using namespace ovtest;

namespace
{

// The allocator as its description reads, with the standard library's containers.
class AllocatorModel
{
  public:
    explicit AllocatorModel(uint32 bound) : records_(bound)
    {
        for (uint32 id = 0; id < bound; ++id) {
            free_.push_back(id);
        }
    }

    // Where a host operation of the binding fails.
    enum class SetFault { none, dup, insert };

    int set(uint32 id, const std::string &name, SetFault fault, int code)
    {
        if (name == "default") {
            return 0;
        }
        if (id >= bound()) {
            return 14002;
        }
        Record &record = records_[id];
        if (record.name) {
            rename(id, std::nullopt);
            const auto place = std::ranges::find(order_, id);
            if (place == order_.end()) {
                return 14004;
            }
            order_.erase(place);
        } else {
            free_.remove(id);
        }
        if (fault == SetFault::dup) {
            return code;
        }
        rename(id, name);
        if (fault == SetFault::insert) {
            return code;
        }
        const auto place = std::ranges::upper_bound(
            order_, name, {}, [this](uint32 other) { return *records_[other].name; });
        order_.insert(place, id);
        return 0;
    }

    // Whether the name has left the order of names, too, is the answer.
    int free(const std::string &name, uint64 now)
    {
        const std::optional<uint32> id = find(name);
        if (!id) {
            return 14004;
        }
        rename(*id, std::nullopt);
        records_[*id].freed_at = now;
        free_.push_back(*id);
        const auto place = std::ranges::find(order_, *id);
        if (place == order_.end()) {
            return 14004;
        }
        order_.erase(place);
        return 0;
    }

    // The lowest ID of those with the name.
    std::optional<uint32> find(const std::string &name) const
    {
        const auto found = ids_by_name_.lower_bound({name, 0});
        return found != ids_by_name_.end() && found->first == name ? std::optional(found->second)
                                                                   : std::nullopt;
    }

    std::optional<uint32> find_in_order(const std::string &name)
    {
        const std::size_t total = order_.size();
        if (start_ >= total) {
            start_ = 0;
        }
        for (std::size_t n = 0; n < total; ++n) {
            const std::size_t position = (start_ + n) % total;
            if (records_[order_[position]].name == name) {
                start_ = position;
                return order_[position];
            }
        }
        return std::nullopt;
    }

    // Status and IDs, as offer() tells them.
    std::string offer(uint32 number, uint64 now) const
    {
        if (number == 0) {
            return "0";
        }
        if (static_cast<uint32>(order_.size()) + number > bound() - 20) {
            return "1";
        }
        std::string ids;
        uint32 count = 0;
        for (const uint32 id : free_) {
            const uint64 freed_at = records_[id].freed_at;
            if (freed_at != 0 && now - freed_at <= 60000) {
                break;
            }
            ids += ' ' + std::to_string(id);
            if (++count == number) {
                return '0' + ids;
            }
        }
        return '1' + ids;
    }

    std::vector<std::string> names_in_order() const
    {
        std::vector<std::string> names;
        for (const uint32 id : order_) {
            names.push_back(*records_[id].name);
        }
        return names;
    }

    uint32 bound() const { return static_cast<uint32>(records_.size()); }
    uint32 num_in_order() const { return static_cast<uint32>(order_.size()); }

  private:
    struct Record {
        std::optional<std::string> name = std::nullopt;
        uint64 freed_at = 0;
    };

    void rename(uint32 id, const std::optional<std::string> &name)
    {
        std::optional<std::string> &old = records_[id].name;
        if (old) {
            ids_by_name_.erase({*old, id});
        }
        old = name;
        if (name) {
            ids_by_name_.emplace(*name, id);
        }
    }

    std::vector<Record> records_;
    std::set<std::pair<std::string, uint32>> ids_by_name_;
    std::list<uint32> free_;
    std::vector<uint32> order_;
    std::size_t start_ = 0;
};

// Some that are special, and so many of tunnels.
std::vector<std::string> make_names(unsigned num_tunnels)
{
    std::vector<std::string> made = {"",
                                     "default",
                                     "defaults",
                                     "\xff\x80",
                                     std::string(64, 'x'),
                                     std::string(65, 'x'),
                                     std::string(300, 'x'),
                                     std::string(299, 'x') + 'y'};
    for (unsigned i = 0; i < num_tunnels; ++i) {
        made.push_back("tunnel" + std::to_string(i));
    }
    return made;
}

// How long the allocator works, and on what.
struct Course {
    uint32 bound;
    unsigned num_tunnels = 60;
    unsigned steps = 20000;
    unsigned steps_of_an_era = 1000; // then it begins anew
    unsigned steps_between_comparisons = 20;
    std::vector<unsigned> bindings_of_9_in_turn = {6}; // the others are releases
    // What takes long where there are many tunnels is done one of so many times.
    unsigned times_of_a_long_step = 1;
};

void PrintTo(const Course &course, std::ostream *out)
{
    *out << course.bound;
}

// How often nearly all IDs were in use, and then few of them.
class Tide
{
  public:
    explicit Tide(uint32 bound) : bound_(bound) {}

    void see(uint32 num_used)
    {
        most_ = std::max(most_, num_used);
        if (num_used > bound_ / 10 * 9) {
            is_full_ = true;
        } else if (is_full_ && num_used < bound_ / 3) {
            is_full_ = false;
            ++times_emptied_;
        }
    }

    uint32 most() const { return most_; }
    std::size_t times_emptied() const { return times_emptied_; }

  private:
    uint32 bound_;
    uint32 most_ = 0;
    bool is_full_ = false;
    std::size_t times_emptied_ = 0;
};

class TunnelIdModel : public LibraryTest, public testing::WithParamInterface<Course>
{
  protected:
    TunnelIdModel() { host_.set_log_level(2); }

    void TearDown() override
    {
        end_tunnel_ids();
        LibraryTest::TearDown();
    }

    // Restarts the allocator, and the time with it.
    void begin()
    {
        begin_tunnel_ids(GetParam().bound);
        model_ = AllocatorModel(GetParam().bound);
        now_ = below(2) * 1000;
        tell_time();
    }

    void step(unsigned bindings_of_9)
    {
        constexpr unsigned first_binding = 3;
        const unsigned chosen = below(16);
        if (chosen < first_binding) {
            return advance();
        }
        if (chosen < first_binding + 9) {
            return chosen < first_binding + bindings_of_9 ? bind() : release();
        }
        if (chosen == 13 || chosen == 14) {
            return look_up();
        }
        if (below(GetParam().times_of_a_long_step) == 0) {
            return chosen == 12 ? ask_for_some() : look_up_in_order();
        }
    }

    void compare_all()
    {
        ASSERT_EQ(in_library(md_get_total_tunnels), static_cast<int>(model_.num_in_order()));
        ASSERT_EQ(names_in_order(), model_.names_in_order());
        for (const std::string &name : names_) {
            ASSERT_EQ(id_of(name), found(model_.find(name), "77")) << name;
        }
        // With this number the sum is 0, and all that can be offered is.
        const uint32 all = 0 - model_.num_in_order();
        ASSERT_EQ(offer(all), model_.offer(all, now_));
    }

    const std::string &any_name() { return names_[below(names_.size())]; }

    uint32 num_in_order() const { return model_.num_in_order(); }

  private:
    static std::string found(const std::optional<uint32> &id, const std::string &without)
    {
        return id ? "0 " + std::to_string(*id) : "14004 " + without;
    }

    // By the host's record, or by the clock alone.
    void tell_time()
    {
        const bool by_clock = below(4) == 0;
        planted().without_time_info = by_clock;
        planted().ms_since_boot = now_;
        host_.set_time(now_);
        if (by_clock) {
            time_info_ptr = nullptr;
        }
    }

    void advance()
    {
        constexpr uint64 distances[] = {0, 1, 100, 5000, 30000, 59999, 60000, 60001, 500000};
        now_ += distances[below(std::size(distances))];
        tell_time();
    }

    void bind()
    {
        using SetFault = AllocatorModel::SetFault;
        constexpr int codes[] = {14000, 14120, 13999};
        // Now and then past the bound; mostly what the allocator offers, as a host does.
        uint32 id = below(model_.bound() + 2);
        if (below(4) != 0) {
            const std::string offered = model_.offer(1, now_);
            id = offered.size() > 2 ? static_cast<uint32>(std::stoul(offered.substr(2))) : id;
        }
        const std::string &name = any_name();
        const int code = codes[below(std::size(codes))];
        const unsigned chance = below(32);
        const SetFault fault = chance == 0   ? SetFault::dup
                               : chance == 1 ? SetFault::insert
                                             : SetFault::none;
        if (fault != SetFault::none) {
            arm({.operation = fault == SetFault::dup ? Operation::ts_dup
                                                     : Operation::uint32_array_insert_sorted,
                 .code = code});
        }
        const int status = set_id(id, name);
        disarm();
        ASSERT_EQ(status, model_.set(id, name, fault, code)) << id << ' ' << name;
    }

    void release()
    {
        const std::string &name = any_name();
        const int status = free_id(name);
        ASSERT_EQ(status, model_.free(name, now_)) << name;
    }

    void ask_for_some()
    {
        const uint32 number = below(model_.bound() + 3);
        ASSERT_EQ(offer(number), model_.offer(number, now_));
    }

    void look_up()
    {
        const std::string &name = any_name();
        ASSERT_EQ(id_of(name), found(model_.find(name), "77")) << name;
    }

    void look_up_in_order()
    {
        const std::string &name = any_name();
        ASSERT_EQ(sorted_id_of(name), found(model_.find_in_order(name), "65535")) << name;
    }

    uint32 below(std::size_t end) { return static_cast<uint32>(random_() % end); }

    std::mt19937 random_{20240609};
    std::vector<std::string> names_ = make_names(GetParam().num_tunnels);
    AllocatorModel model_{0};
    uint64 now_ = 0;
};

TEST_P(TunnelIdModel, AgreesWithTheAllocator)
{
    const Course &course = GetParam();
    const std::size_t num_turns = course.bindings_of_9_in_turn.size();
    Tide tide(course.bound);
    for (unsigned n = 0; n < course.steps; ++n) {
        if (n % course.steps_of_an_era == 0) {
            begin();
        }
        const std::size_t turn = n * num_turns / course.steps;
        ASSERT_NO_FATAL_FAILURE(step(course.bindings_of_9_in_turn[turn])) << "step " << n;
        if ((n + 1) % course.steps_between_comparisons == 0) {
            ASSERT_NO_FATAL_FAILURE(compare_all()) << "after step " << n;
        }
        tide.see(num_in_order());
        forget_calls();
    }
    // The steps have met what they are about.
    EXPECT_GT(tide.most(), course.bound / 2);
    if (num_turns > 1) {
        EXPECT_EQ(tide.times_emptied(), num_turns / 2);
    }
}

// With the last one the IDs run out and come back twice, and it never begins anew.
constexpr unsigned steps_without_end = sanitized ? 30000 : 100000;

const Course courses[] = {
    {.bound = 19},
    {.bound = 20},
    {.bound = 21},
    {.bound = 30},
    {.bound = 60},
    {.bound = 200},
    {.bound = 1000,
     .num_tunnels = 1200,
     .steps = steps_without_end,
     .steps_of_an_era = steps_without_end,
     .steps_between_comparisons = steps_without_end / 12,
     .bindings_of_9_in_turn = {7, 1, 7, 1},
     .times_of_a_long_step = 64},
};

INSTANTIATE_TEST_SUITE_P(Bounds, TunnelIdModel, testing::ValuesIn(courses),
                         testing::PrintToStringParamName());

} // namespace
