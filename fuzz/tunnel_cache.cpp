// The management tunnel cache, beside a map of what its header promises.
#include "fuzz/host.h"
#include "orvale/md_tunbin_ht.h"

#include <fuzzer/FuzzedDataProvider.h>

#include <algorithm>
#include <map>
#include <string>

namespace
{

using namespace ovfuzz;

// A text that two tunnels claim leads to none until it is deleted.
class TextModel
{
  public:
    void add(const std::string &text, uint32 id)
    {
        const auto [at, is_new] = ids_.emplace(text, id);
        if (!is_new && at->second != id) {
            at->second = TUNNEL_ID_NONE;
        }
    }
    void del(const std::string &text) { ids_.erase(text); }
    uint32 find(const std::string &text) const
    {
        const auto at = ids_.find(text);
        return at != ids_.end() ? at->second : TUNNEL_ID_NONE;
    }

  private:
    std::map<std::string, uint32> ids_;
};

struct Model {
    std::map<uint32, std::string> names_by_id;
    TextModel names;
    TextModel aliases;
};

template <std::size_t size>
std::string fill(char (&field)[size], FuzzedDataProvider &input)
{
    const std::string text = input.ConsumeRandomLengthString(size);
    text.copy(field, size);
    // A text that fills its field to the last byte is read without it.
    return std::string(field, std::find(field, field + size - 1, '\0'));
}

void compare(const Model &model, uint32 id, const std::string &name, const std::string &alias)
{
    const auto known = model.names_by_id.find(id);
    const bool is_known = known != model.names_by_id.end();
    require(md_tunbin_ht_id_has_tunnel(id) == is_known, "an ID has a tunnel from adding on");
    const char *const found = md_tunbin_ht_get_name_by_id(id);
    require(is_known ? found != nullptr && known->second == found : found == nullptr,
            "an ID leads to the name added last");
    require(md_tunbin_ht_get_id_by_name(name.c_str()) == model.names.find(name),
            "a name leads to its ID");
    require(md_tunbin_ht_get_id_by_alias(alias.c_str()) == model.aliases.find(alias),
            "an alias leads to its ID");
}

void step(Model &model, FuzzedDataProvider &input)
{
    tunnel_config_bin_t tunnel = {};
    const bool adds = input.ConsumeBool();
    // A few IDs, so that they meet again; those around the end of the cache among them.
    tunnel.tp_tunnel_id =
        input.ConsumeBool()
            ? input.ConsumeIntegralInRange<uint32>(0, 7)
            : input.ConsumeIntegralInRange<uint32>(MD_TUNBIN_HT_SIZE - 2, MD_TUNBIN_HT_SIZE + 1);
    const std::string name = fill(tunnel.tp_tunnel_name, input);
    const std::string alias = fill(tunnel.tp_tunnel_alias, input);
    const uint32 id = tunnel.tp_tunnel_id;
    const int status = adds ? md_tunbin_ht_add(&tunnel) : md_tunbin_ht_del(&tunnel);
    if (id >= MD_TUNBIN_HT_SIZE) {
        require(status == 14000, "an ID out of range is refused");
    } else if (adds) {
        model.names_by_id[id] = name;
        model.names.add(name, id);
        model.aliases.add(alias, id);
    } else {
        model.names_by_id.erase(id);
        model.names.del(name);
        model.aliases.del(alias);
    }
    compare(model, id, name, alias);
}

} // namespace

int LLVMFuzzerTestOneInput(const std::uint8_t *data, std::size_t size)
{
    FuzzedDataProvider input(data, size);
    (void)md_tunbin_ht_init();
    Model model;
    while (input.remaining_bytes() != 0) {
        step(model, input);
    }
    return 0;
}
