#include "mgmt/kinagt_sampling.h"

#include "tasks/inventory_listing.h"
#include "tasks/task_queue_elem.h"
#include "util/corvel_home.h"
#include "util/str_str_map.h"
#include "util/string_tokenizer.h"
#include "util/trace.h"
#include "util/util.h"

using VMQ::String;
using VMQ::StrStrMap;
using VMQ::Trace;
using VMQ::Util;

namespace {

RAS1_Unit traceUnit{"mgmt/kinagt_sampling"};

constexpr char ARCHITECTURE_HEADER[] = "ArchitectureHeader";

struct Architecture {
  String os;
  String code;  ///< the shell variable cArch
};

template <size_t Width>
void setColumn(char (&column)[Width], const String& value) {
  TaskQueueElem::SetValueAndPad(column, Width, value.toNarrow().c_str());
}

/// Asks the installation's architecture script; both parts stay empty when it does not answer as expected.
Architecture probeArchitecture(const Trace& trace) {
  const String home = VMQ_CORVELHOME;
  const String command = String("/bin/ksh") + " " + "-c" + " '" + ". " + home + "/bin/dynarch.shl" + " " + home +
                         "/registry/archdsc.tbl" + " >" + "/dev/null" + " 2>&1;echo " + ARCHITECTURE_HEADER +
                         ";echo $os;echo $cArch" + "'";
  Architecture architecture;
  int exitCode = 0;
  String out;
  String err;
  if (!Util::runCommand(command, exitCode, out, err, "", /*nonBlocking=*/false) || exitCode != 0) return architecture;
  const unsigned header = out.find(String(ARCHITECTURE_HEADER), 0);
  if (header == String::NPOS) {
    TRACE_ERROR(trace, "Could not find header %s in output", ARCHITECTURE_HEADER);
    return architecture;
  }
  StringTokenizer tokens(out.substr(header), "\n");
  const int count = tokens.countTokens();
  if (count != 3) {
    TRACE_ERROR(trace, "Expected 3 tokens, Header and $os and $cArch, but we got %d tokens", count);
    while (tokens.hasMoreTokens()) TRACE_ERROR(trace, "Received token ***%s***", tokens.nextToken().c_str().get());
    return architecture;
  }
  tokens.nextToken();
  architecture.os = tokens.nextToken();
  architecture.code = tokens.nextToken();
  TRACE_DETAIL(trace, "$os = %s, $cArch = %s", architecture.os.c_str().get(), architecture.code.c_str().get());
  return architecture;
}

/// An eight-digit version reads in the nine-digit form.
String widenedVersion(const String& version) {
  return version.length() == 8 ? version.substr(0, 6) + "0" + version.substr(6) : version;
}

void runQinfo(const Trace& trace, const char* option, const String& prodDesc, const vmq_kinagt_data_t& rowTemplate,
              const std::function<void(vmq_kinagt_data_t&)>& takeRow) {
  const String command = inventoryCommand(option);
  TRACE_DETAIL(trace, "qinfo command is: [%s]", command.c_str().get());
  int exitCode = 0;
  String out;
  String err;
  if (!Util::runCommand(command, exitCode, out, err, "", /*nonBlocking=*/false) || exitCode != 0) return;

  StrStrMap seen;  // a list would make ten thousand products cost fifty million comparisons
  forEachInventoryRecord(out, InventoryFields::kAtLeastFive, [&](const InventoryRecord& record) {
    const String version = widenedVersion(record.version);
    const String key = record.product_code + record.description + record.platform + version + record.release;
    String ignored;
    if (seen.get(key, ignored)) {
      TRACE_DETAIL(trace, "skipping duplicate info in this line");
      return true;
    }
    seen.put(key, "");
    vmq_kinagt_data_t row = rowTemplate;
    setColumn(row.product, record.product_code);
    setColumn(row.proddesc, prodDesc.length() != 0 ? prodDesc : record.description);
    setColumn(row.platform, record.platform);
    setColumn(row.version, version);
    setColumn(row.release, record.release);
    takeRow(row);
    return true;
  });
}

}  // namespace

void sampleInventory(const String& originNode, const String& prodDesc,
                     const std::function<void(vmq_kinagt_data_t& row)>& takeRow) {
  const Trace trace(traceUnit);
  const Architecture architecture = probeArchitecture(trace);
  vmq_kinagt_data_t rowTemplate = {};
  setColumn(rowTemplate.originnode, originNode);
  setColumn(rowTemplate.corvelhome, VMQ_CORVELHOME);
  setColumn(rowTemplate.hosttype, architecture.os);
  setColumn(rowTemplate.hostpc, architecture.code);
  if (prodDesc.find(String("RUNNING"), 0) != String::NPOS) {
    runQinfo(trace, "-r", prodDesc, rowTemplate, takeRow);
  } else {
    runQinfo(trace, "-d", prodDesc, rowTemplate, takeRow);
    runQinfo(trace, "-x", prodDesc, rowTemplate, takeRow);
  }
}
