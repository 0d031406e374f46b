// The host operations as the library finds them: the test program exports them, and each passes its
// call on to the host's own.
#include "tests/support/allocation_layer.h"
#include "tests/support/fault_state.h"

#include <dlfcn.h>

#include <cstdarg>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <tuple>

namespace ovtest
{

namespace
{

template <typename Function>
struct signature;
template <typename Answer, typename... Parameters>
struct signature<Answer(Parameters...)> {
    using answer = Answer;
    template <std::size_t index>
    using parameter = std::tuple_element_t<index, std::tuple<Parameters...>>;
};
template <typename Answer, typename... Parameters>
struct signature<Answer(Parameters..., ...)> {
    using answer = Answer;
};

template <typename Function>
Function *next_definition(const char *name)
{
    void *const found = dlsym(RTLD_NEXT, name);
    if (found == nullptr) {
        std::fprintf(stderr, "the host does not provide %s\n", name);
        std::abort();
    }
    return reinterpret_cast<Function *>(found);
}

std::string described(const char *text)
{
    return text != nullptr ? '"' + std::string(text) + '"' : "null";
}

template <typename T>
std::string described(T argument)
{
    if constexpr (std::is_pointer_v<T>) {
        if (argument == nullptr) {
            return "null";
        }
        const std::string name = name_of_object(argument);
        return name.empty() ? "*" : name;
    } else {
        return std::to_string(argument);
    }
}

template <typename... Arguments>
std::string described_call(const char *name, Arguments... arguments)
{
    std::string call = std::string(name) + '(';
    [[maybe_unused]] const char *separator = "";
    ((call += separator + described(arguments), separator = ", "), ...);
    return call + ')';
}

// The kind of object that a parameter hands out or takes back; null for every other parameter.
template <typename T>
constexpr const char *kind_of_object = nullptr;
template <>
constexpr const char *kind_of_object<tstring **> = "tstring";
template <>
constexpr const char *kind_of_object<tstr_array **> = "tstr_array";
template <>
constexpr const char *kind_of_object<uint32_array **> = "uint32_array";
template <>
constexpr const char *kind_of_object<bn_binding **> = "bn_binding";
template <>
constexpr const char *kind_of_object<bn_request **> = "bn_request";

// Keeps the account of one parameter, from the pointer behind it before and after the call.
template <typename T>
class ParameterAccount
{
  public:
    explicit ParameterAccount(T parameter) : parameter_(parameter)
    {
        if constexpr (kind_of_object<T> != nullptr) {
            before_ = parameter != nullptr ? *parameter : nullptr;
        }
    }

    void settle(bool by_library, bool operation_frees) const
    {
        if constexpr (kind_of_object<T> != nullptr) {
            const void *const now = parameter_ != nullptr ? *parameter_ : nullptr;
            if (now == before_) {
                return;
            }
            const bool was_known = before_ == nullptr || forget_object(before_);
            if (operation_frees && by_library && !was_known) {
                note_misuse(std::string("the library freed a foreign ") + kind_of_object<T>);
            }
            if (now != nullptr && by_library) {
                note_object(now, kind_of_object<T>);
            }
        } else if constexpr (std::is_same_v<T, char **>) {
            if (parameter_ != nullptr && by_library) {
                watch_text(*parameter_);
            }
        }
    }

  private:
    T parameter_;
    const void *before_ = nullptr;
};

template <typename... Parameters>
class Accounts
{
  public:
    explicit Accounts(Parameters... parameters)
        : by_library_(library_is_running()), accounts_(ParameterAccount<Parameters>(parameters)...)
    {
    }
    Accounts(const Accounts &) = delete;
    Accounts &operator=(const Accounts &) = delete;

    void settle(bool operation_frees) const
    {
        std::apply(
            [&](const auto &...account) { (account.settle(by_library_, operation_frees), ...); },
            accounts_);
    }

  private:
    bool by_library_;
    std::tuple<ParameterAccount<Parameters>...> accounts_;
};

template <typename T>
void hand_out_nothing(T parameter)
{
    if constexpr (kind_of_object<T> != nullptr || std::is_same_v<T, char **> ||
                  std::is_same_v<T, gcl_session **>) {
        *parameter = nullptr;
    }
}

template <typename Answer, OperationKind kind, typename... Parameters>
Answer failed_answer(Parameters... parameters)
{
    if constexpr (kind == OperationKind::status || kind == OperationKind::query) {
        if (armed_fault().way == FaultWay::without_object) {
            (hand_out_nothing(parameters), ...);
            return 0;
        }
        return armed_fault().code;
    } else if constexpr (kind == OperationKind::yes_no || kind == OperationKind::pointer) {
        return {};
    } else {
        std::fprintf(stderr, "an operation that cannot fail was made to\n");
        std::abort();
    }
}

template <typename Answer>
void watch_answer(Answer)
{
}

void watch_answer(char *text)
{
    watch_text(text);
}

template <Operation operation>
constexpr bool gives_max_entries =
    operation == Operation::get_max_rmap_entries || operation == Operation::get_max_omap_entries ||
    operation == Operation::get_max_qmap_entries || operation == Operation::get_max_smap_entries ||
    operation == Operation::get_max_nmap_entries ||
    operation == Operation::get_max_dns_proxy_map_entries;

int hand_out_names(const std::vector<std::string> &names, tstr_array **ret)
{
    int status = tstr_array_new(ret, nullptr);
    for (const std::string &name : names) {
        status = status != 0 ? status : tstr_array_append_str(*ret, name.c_str());
    }
    return status;
}

int refuse_with(const std::string &text, char **reason)
{
    std::free(*reason);
    *reason = strdup(text.c_str());
    return lc_err_parse_error;
}

template <std::size_t index, typename... Arguments>
auto argument(Arguments... arguments)
{
    return std::get<index>(std::tuple(arguments...));
}

// The host's answer, or the one that the test has planted.
template <Operation operation, typename Real, typename... Arguments>
auto answer_of(Real *real, Arguments... arguments)
{
    if constexpr (operation == Operation::get_max_tunnel_number) {
        std::vector<uint32> &bounds = planted().tunnel_bounds;
        if (!bounds.empty()) {
            const uint32 bound = bounds.front();
            if (bounds.size() > 1) {
                bounds.erase(bounds.begin());
            }
            return bound;
        }
    } else if constexpr (operation == Operation::sys_time_since_boot_ms) {
        if (planted().ms_since_boot) {
            return *planted().ms_since_boot;
        }
    } else if constexpr (operation == Operation::ctime_init) {
        if (planted().without_time_info) {
            return;
        }
    } else if constexpr (operation == Operation::ovif_get_ifcount) {
        if (planted().kernel_interfaces) {
            return *planted().kernel_interfaces;
        }
    } else if constexpr (operation == Operation::mgmt_is_same_subnet_using_masklen) {
        if (planted().one_subnet) {
            return tbool{true};
        }
    } else if constexpr (operation == Operation::bn_binding_name_parts_pattern_match) {
        if (planted().every_name_matches) {
            return tbool{true};
        }
    } else if constexpr (operation == Operation::get_config_name) {
        if (planted().config_name) {
            return planted().config_name->c_str();
        }
    } else if constexpr (operation == Operation::mdb_get_matching_tstr_array) {
        if (planted().matching_names) {
            return hand_out_names(*planted().matching_names, argument<4>(arguments...));
        }
    } else if constexpr (operation == Operation::ov_acl_validate_matchstr) {
        if (planted().match_string_reason) {
            (void)real(arguments...);
            return refuse_with(*planted().match_string_reason, argument<3>(arguments...));
        }
    } else if constexpr (gives_max_entries<operation>) {
        const auto found = planted().max_entries.find(operation);
        if (found != planted().max_entries.end()) {
            return found->second;
        }
    }
    return real(arguments...);
}

// What these answer about null is the host's own business.
template <Operation operation>
constexpr bool asks_about_a_string =
    operation == Operation::ts_str_ || operation == Operation::ts_length_ ||
    operation == Operation::ts_equal_str || operation == Operation::ts_cmp_str;

// One call of an operation, by whomever: `real` gets the same arguments, and a format's text
// behind them.
template <Operation operation, typename Answer, typename Real, typename... Arguments>
Answer host_call(Real *real, Arguments... arguments)
{
    const bool by_library = library_is_running();
    if (host_is_at_work()) {
        return answer_of<operation>(real, arguments...);
    }
    const Accounts<Arguments...> accounts(arguments...);
    const HostScope scope;
    if (by_library) {
        note_call(operation, described_call(row_of(operation).name, arguments...));
        if constexpr (asks_about_a_string<operation>) {
            if (argument<0>(arguments...) == nullptr) {
                note_misuse(std::string("the library asked ") + row_of(operation).name +
                            " about null");
            }
        }
        if (fault_strikes(operation)) {
            return failed_answer<Answer, row_of(operation).kind>(arguments...);
        }
        if constexpr (operation == Operation::tstr_array_get_str_quick) {
            if (planted().null_text_at_call == num_calls(operation)) {
                return nullptr;
            }
        }
    }
    if constexpr (std::is_void_v<Answer>) {
        answer_of<operation>(real, arguments...);
        accounts.settle(true);
    } else {
        const Answer answer = answer_of<operation>(real, arguments...);
        accounts.settle(false);
        if (by_library) {
            watch_answer(answer);
        }
        return answer;
    }
}

// What a format and its arguments say, without asking for memory on behalf of the library.
class FormattedText
{
  public:
    explicit FormattedText(const char *format, va_list arguments)
    {
        const int length = std::vsnprintf(text_, sizeof text_, format, arguments);
        if (length < 0 || static_cast<std::size_t>(length) >= sizeof text_) {
            std::fprintf(stderr, "the text of \"%s\" is longer than the test expects\n", format);
            std::abort();
        }
    }
    const char *get() const { return text_; }

  private:
    char text_[16384];
};

} // namespace

} // namespace ovtest

using namespace ovtest;

#define OVTEST_PARAMETER(name, index) signature<decltype(name)>::parameter<index> a##index
#define OVTEST_PARAMETERS_0(name)
#define OVTEST_PARAMETERS_1(name) OVTEST_PARAMETER(name, 0)
#define OVTEST_PARAMETERS_2(name) OVTEST_PARAMETERS_1(name), OVTEST_PARAMETER(name, 1)
#define OVTEST_PARAMETERS_3(name) OVTEST_PARAMETERS_2(name), OVTEST_PARAMETER(name, 2)
#define OVTEST_PARAMETERS_4(name) OVTEST_PARAMETERS_3(name), OVTEST_PARAMETER(name, 3)
#define OVTEST_PARAMETERS_5(name) OVTEST_PARAMETERS_4(name), OVTEST_PARAMETER(name, 4)
#define OVTEST_PARAMETERS_6(name) OVTEST_PARAMETERS_5(name), OVTEST_PARAMETER(name, 5)
#define OVTEST_PARAMETERS_7(name) OVTEST_PARAMETERS_6(name), OVTEST_PARAMETER(name, 6)
#define OVTEST_ARGUMENTS_0
#define OVTEST_ARGUMENTS_1 , a0
#define OVTEST_ARGUMENTS_2 OVTEST_ARGUMENTS_1, a1
#define OVTEST_ARGUMENTS_3 OVTEST_ARGUMENTS_2, a2
#define OVTEST_ARGUMENTS_4 OVTEST_ARGUMENTS_3, a3
#define OVTEST_ARGUMENTS_5 OVTEST_ARGUMENTS_4, a4
#define OVTEST_ARGUMENTS_6 OVTEST_ARGUMENTS_5, a5
#define OVTEST_ARGUMENTS_7 OVTEST_ARGUMENTS_6, a6

// The library resolves its operations before the first of them is called, but dlsym may allocate:
// looking up happens as the host's own doing.
#define OVTEST_REAL(name)                                                                          \
    static decltype(name) *const real = [] {                                                       \
        const HostScope looking_up;                                                                \
        return next_definition<decltype(name)>(#name);                                             \
    }()

#define OVTEST_DEFINE(kind, name, count)                                                           \
    extern "C" signature<decltype(name)>::answer name(OVTEST_PARAMETERS_##count(name))             \
    {                                                                                              \
        OVTEST_REAL(name);                                                                         \
        return host_call<Operation::name, signature<decltype(name)>::answer>(                      \
            real OVTEST_ARGUMENTS_##count);                                                        \
    }
#define OVTEST_DEFINED_BELOW(...)
OVTEST_HOST_OPERATIONS(OVTEST_DEFINE, OVTEST_DEFINED_BELOW)

#define OVTEST_FORMAT(text, format)                                                                \
    va_list format_arguments;                                                                      \
    va_start(format_arguments, format);                                                            \
    const FormattedText text(format, format_arguments);                                            \
    va_end(format_arguments)

extern "C" {

int mdb_set_node_str(md_commit *commit, mdb_db *db, int op, uint32 flags, bn_type type,
                     const char *value, const char *name_format, ...)
{
    OVTEST_REAL(mdb_set_node_str);
    OVTEST_FORMAT(name, name_format);
    return host_call<Operation::mdb_set_node_str, int>(real, commit, db, op, flags, type, value,
                                                       "%s", name.get());
}

int md_commit_set_return_status_msg_fmt(md_commit *commit, int code, const char *format, ...)
{
    OVTEST_REAL(md_commit_set_return_status_msg_fmt);
    OVTEST_FORMAT(text, format);
    return host_call<Operation::md_commit_set_return_status_msg_fmt, int>(real, commit, code, "%s",
                                                                          text.get());
}

int ts_new_sprintf(tstring **ret, const char *format, ...)
{
    OVTEST_REAL(ts_new_sprintf);
    OVTEST_FORMAT(text, format);
    return host_call<Operation::ts_new_sprintf, int>(real, ret, "%s", text.get());
}

char *smprintf(const char *format, ...)
{
    OVTEST_REAL(smprintf);
    OVTEST_FORMAT(text, format);
    return host_call<Operation::smprintf, char *>(real, "%s", text.get());
}

int lc_log_internal(const char *function, const char *unit, int line, uint32 flags, uint32 zero,
                    int level, const char *format, ...)
{
    OVTEST_REAL(lc_log_internal);
    OVTEST_FORMAT(text, format);
    if (library_is_running()) {
        const HostScope noting;
        note_log_line(unit_log_line(function, unit, line, flags, zero, level, text.get()));
    }
    return host_call<Operation::lc_log_internal, int>(real, function, unit, line, flags, zero,
                                                      level, "%s", text.get());
}

void ov_log_internal(int level, const char *function, int zero, const char *format, ...)
{
    OVTEST_REAL(ov_log_internal);
    OVTEST_FORMAT(text, format);
    if (library_is_running()) {
        const HostScope noting;
        note_log_line(ov_log_line(level, function, zero, text.get()));
    }
    host_call<Operation::ov_log_internal, void>(real, level, function, zero, "%s", text.get());
}
}
