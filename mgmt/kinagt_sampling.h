#pragma once
// Turns what the installation's tools print into rows of the inventory table.

#include <functional>

#include "mgmt/rows.h"
#include "util/string.h"

/// Runs the inventory for a PRODDESC value (empty: none asked for) and hands over each row in order; the row may be
/// changed by the taker. A value that holds "RUNNING" lists what runs; any other lists what is installed, then what
/// else the tool knows. Failures are traced and leave rows out. For any thread.
void sampleInventory(const VMQ::String& originNode, const VMQ::String& prodDesc,
                     const std::function<void(vmq_kinagt_data_t& row)>& takeRow);
