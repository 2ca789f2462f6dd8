#pragma once
// KAGDYST, the status table: its rows exist only as events, one for each queued request that has ended.

#include "mgmt/rows.h"
#include "mgmt/table_binding.h"

class vmq_kagdyst_manager;

inline constexpr char vmq_kagdyst_application[] = "VMQ";
inline constexpr char vmq_kagdyst_table[] = "KAGDYST";
/// Null until the table is registered; then lives as long as the process.
extern vmq_kagdyst_manager* vmq_kagdyst_static_manager;

struct vmq_kagdyst_description {
  using Row = vmq_kagdyst_data_t;
  static constexpr char requestClass[] = "vmq_kagdyst_base";
  static constexpr VMQ::TableColumn columns[] = {
      VMQ_COLUMN("ORIGINNODE", Row, originnode), VMQ_COLUMN("TRANSID", Row, transid),
      VMQ_COLUMN("COMMAND", Row, command),       VMQ_COLUMN("RETVAL", Row, retval),
      VMQ_COLUMN("RETMSGID", Row, retmsgid),     VMQ_COLUMN("RETMSGPARM", Row, retmsgparm),
      VMQ_COLUMN("TARGETMSN", Row, targetmsn),
  };
};

class vmq_kagdyst_base : public VMQ::TableRequest<vmq_kagdyst_description> {
 public:
  using TableRequest::TableRequest;
};

// NOLINTNEXTLINE(cppcoreguidelines-special-member-functions): its base cannot be copied
class vmq_kagdyst_agent : public vmq_kagdyst_base {
 public:
  using vmq_kagdyst_base::vmq_kagdyst_base;
  ~vmq_kagdyst_agent() override { TakeSampleDestructor(); }

  void TakeSampleConstructor();
  /// Gives no rows: a plain query is always empty.
  void TakeSample() override;
  void TakeSampleDestructor();
};

class vmq_kagdyst_manager
    : public VMQ::TableBinding<vmq_kagdyst_agent, vmq_kagdyst_manager, vmq_kagdyst_static_manager> {
 public:
  using TableBinding::TableBinding;
};

/// Makes the manager and registers the table; the status of the registration. Once, for the entry point.
unsigned vmq_kagdyst_init();
