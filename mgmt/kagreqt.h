#pragma once
// KAGREQT, the request table: a query's predicates carry a command and its parameters, and its one row is the answer.

#include "mgmt/rows.h"
#include "mgmt/table_binding.h"
#include "tasks/task_queue_elem.h"

class vmq_kagreqt_manager;

inline constexpr char vmq_kagreqt_application[] = "VMQ";
inline constexpr char vmq_kagreqt_table[] = "KAGREQT";
/// Null until the table is registered; then lives as long as the process.
extern vmq_kagreqt_manager* vmq_kagreqt_static_manager;

struct vmq_kagreqt_description {
  using Row = vmq_kagreqt_data_t;
  static constexpr char requestClass[] = "vmq_kagreqt_base";
  static constexpr VMQ::TableColumn columns[] = {
      VMQ_COLUMN("ORIGINNODE", Row, originnode), VMQ_COLUMN("TRANSID", Row, transid),
      VMQ_COLUMN("COMMAND", Row, command),       VMQ_COLUMN("PRODUCT", Row, product),
      VMQ_COLUMN("CONTEXT", Row, context),       VMQ_COLUMN("OPTIONAL", Row, optional),
      VMQ_COLUMN("DACONFIG", Row, daconfig),     VMQ_COLUMN("DASCRIPT", Row, dascript),
      VMQ_COLUMN("RETVAL", Row, retval),         VMQ_COLUMN("VERSION", Row, version),
      VMQ_COLUMN("RETMSGID", Row, retmsgid),     VMQ_COLUMN("RETMSGPARM", Row, retmsgparm),
      VMQ_COLUMN("TARGETMSN", Row, targetmsn),
  };
};

class vmq_kagreqt_base : public VMQ::TableRequest<vmq_kagreqt_description> {
 public:
  using TableRequest::TableRequest;
};

// NOLINTNEXTLINE(cppcoreguidelines-special-member-functions): its base cannot be copied
class vmq_kagreqt_agent : public vmq_kagreqt_base {
 public:
  using vmq_kagreqt_base::vmq_kagreqt_base;
  ~vmq_kagreqt_agent() override { TakeSampleDestructor(); }

  /// Collects the predicates' values as the command's parameters. Kept on purpose: whatever their operators are.
  void TakeSampleConstructor();
  /// Runs or queues the command and offers the answer row to the request's own predicates. Each call runs it anew.
  void TakeSample() override;
  void TakeSampleDestructor();

 private:
  TaskQueueElem element_;
};

class vmq_kagreqt_manager
    : public VMQ::TableBinding<vmq_kagreqt_agent, vmq_kagreqt_manager, vmq_kagreqt_static_manager> {
 public:
  using TableBinding::TableBinding;
};

/// Makes the manager and registers the table; the status of the registration. Once, for the entry point.
unsigned vmq_kagreqt_init();
