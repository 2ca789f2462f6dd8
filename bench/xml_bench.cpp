// What building a tree costs on top of reading the XML: DOMParser against expat with handlers that only count. Both
// get the document whole, in expat's own buffer.

#include <benchmark/benchmark.h>
#include <expat.h>

#include <cstdlib>
#include <cstring>
#include <string>

#include "util/dom_parser.h"

namespace {

constexpr size_t documentBytes = 1 << 20;

// A run-as file as StartupDB writes it: short texts, much indentation.
std::string runAsDocument() {
  std::string text = "<runas>\n";
  for (int agent = 0; text.size() < documentBytes; ++agent) {
    text += "\t<agent>\n\t\t<productCode>p" + std::to_string(agent) + "</productCode>\n";
    for (int instance = 0; instance < 4; ++instance) {
      text += "\t\t<instance>\n\t\t\t<name>instance" + std::to_string(instance) + "</name>\n\t\t\t<user>dbuser" +
              std::to_string(instance) + "</user>\n\t\t</instance>\n";
    }
    text += "\t</agent>\n";
  }
  return text + "</runas>\n";
}

// Elements with several attributes and a sentence of text.
std::string recordsDocument() {
  std::string text = "<records>\n";
  for (int record = 0; text.size() < documentBytes; ++record) {
    text += "  <record id=\"" + std::to_string(record) +
            "\" state=\"running\" owner=\"operator\">The agent was started, stopped and started again by its "
            "operator during the maintenance window of the night.</record>\n";
  }
  return text + "</records>\n";
}

struct Counts {
  size_t elements = 0;
  size_t attributes = 0;
  size_t bytes = 0;
};

void XMLCALL countStart(void* counts, const char*, const char** attributes) {
  auto& all = *static_cast<Counts*>(counts);
  ++all.elements;
  for (; *attributes != nullptr; attributes += 2) ++all.attributes;
}
void XMLCALL countEnd(void*, const char*) {}
void XMLCALL countCharacters(void* counts, const char*, int length) {
  static_cast<Counts*>(counts)->bytes += static_cast<size_t>(length);
}

void parseWithExpat(benchmark::State& state, const std::string& document) {
  const int length = static_cast<int>(document.size());
  for (auto _ : state) {
    Counts counts;
    const XML_Parser parser = XML_ParserCreate(nullptr);
    XML_SetElementHandler(parser, countStart, countEnd);
    XML_SetCharacterDataHandler(parser, countCharacters);
    XML_SetUserData(parser, &counts);
    std::memcpy(XML_GetBuffer(parser, length), document.data(), document.size());
    if (XML_ParseBuffer(parser, length, /*isFinal=*/1) != XML_STATUS_OK) std::abort();
    XML_ParserFree(parser);
    benchmark::DoNotOptimize(counts);
  }
  state.SetBytesProcessed(static_cast<int64_t>(state.iterations()) * length);
}

void parseWithDom(benchmark::State& state, const std::string& document) {
  for (auto _ : state) {
    VMQ::DOMParser parser(document.c_str());
    if (!parser.parse()) std::abort();
    benchmark::DoNotOptimize(parser.getDocument());
  }
  state.SetBytesProcessed(static_cast<int64_t>(state.iterations() * document.size()));
}

BENCHMARK_CAPTURE(parseWithExpat, runas, runAsDocument())->Unit(benchmark::kMillisecond);
BENCHMARK_CAPTURE(parseWithDom, runas, runAsDocument())->Unit(benchmark::kMillisecond);
BENCHMARK_CAPTURE(parseWithExpat, records, recordsDocument())->Unit(benchmark::kMillisecond);
BENCHMARK_CAPTURE(parseWithDom, records, recordsDocument())->Unit(benchmark::kMillisecond);

}  // namespace
