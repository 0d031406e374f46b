#pragma once
// What the daemon tells framework/appliance.h at its start: which model it runs, and where the
// configuration in force is found. model_nodes.h has what the configuration says of the model.

#include "framework/mdb_db.h"

#include <functional>
#include <string>

namespace ovhost
{

/// Names the model's configuration. This name counts before the one in the configuration; an empty
/// one leaves it to the configuration.
void set_config_name(std::string name);

/// The database in force at the moment of the call; may answer null when there is none yet.
using RunningDbSource = std::function<const mdb_db *()>;

/// Where init_model_info finds the database when its caller has none at hand; an empty source means
/// nowhere.
void set_running_db_source(RunningDbSource source);

} // namespace ovhost
