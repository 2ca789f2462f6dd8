#pragma once
// KINAGT, the inventory table: one row for each installed product and platform.

#include "mgmt/rows.h"
#include "mgmt/table_binding.h"

class vmq_kinagt_manager;

inline constexpr char vmq_kinagt_application[] = "VMQ";
inline constexpr char vmq_kinagt_table[] = "KINAGT";
/// Null until the table is registered; then lives as long as the process.
extern vmq_kinagt_manager* vmq_kinagt_static_manager;

struct vmq_kinagt_description {
  using Row = vmq_kinagt_data_t;
  static constexpr char requestClass[] = "vmq_kinagt_base";
  static constexpr VMQ::TableColumn columns[] = {
      VMQ_COLUMN("ORIGINNODE", Row, originnode), VMQ_COLUMN("CORVELHOME", Row, corvelhome),
      VMQ_COLUMN("HOSTTYPE", Row, hosttype),     VMQ_COLUMN("HOSTPC", Row, hostpc),
      VMQ_COLUMN("PRODUCT", Row, product),       VMQ_COLUMN("VERSION", Row, version),
      VMQ_COLUMN("PRODDESC", Row, proddesc),     VMQ_COLUMN("RELEASE", Row, release),
      VMQ_COLUMN("PLATFORM", Row, platform),
  };
};

class vmq_kinagt_base : public VMQ::TableRequest<vmq_kinagt_description> {
 public:
  using TableRequest::TableRequest;
};

// NOLINTNEXTLINE(cppcoreguidelines-special-member-functions): its base cannot be copied
class vmq_kinagt_agent : public vmq_kinagt_base {
 public:
  using vmq_kinagt_base::vmq_kinagt_base;
  ~vmq_kinagt_agent() override { TakeSampleDestructor(); }

  void TakeSampleConstructor();
  /// Asks the installation's tools and gives the products they name. Runs children: may take long.
  void TakeSample() override;
  void TakeSampleDestructor();
};

class vmq_kinagt_manager : public VMQ::TableBinding<vmq_kinagt_agent, vmq_kinagt_manager, vmq_kinagt_static_manager> {
 public:
  using TableBinding::TableBinding;
};

/// Makes the manager and registers the table; the status of the registration. Once, for the entry point.
unsigned vmq_kinagt_init();
