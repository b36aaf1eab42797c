// morwick stats: parses a dump through the slots of a row and prints its entries.

#include <algorithm>
#include <cstring>
#include <map>
#include <nlohmann/json.hpp>
#include <utility>

#include "morwick/morwick.h"
#include "tools/commands.h"

namespace tools {
namespace {

using Json = nlohmann::ordered_json;
using Entries = std::vector<std::pair<std::string, uint64_t>>;

// What a parser made of the dump.
struct Statistics {
  uint64_t result = 0;  // as the parser returned it
  std::string problem;  // what a person should know; empty when all is well
  Entries summary;      // KVR only; readCountHisto is apart
  std::vector<uint64_t> readCountHisto;
  Entries entries;
};

template <typename Context>
Entries EntriesOf(const Context &context) {
  Entries entries;
  const ContextNode *value = context.valuesHead;
  for (const ContextNode *name = context.namesHead; name != nullptr; name = name->next) {
    entries.emplace_back(name->text, value->value);
    value = value->next;
  }
  return entries;
}

Entries SummaryOf(const KVRStatsCxt &context) {
  return {
      {"exportVersion", context.exportVersion},
      {"numVirtualBlocks", context.numVirtualBlocks},
      {"blocksPerVirtualBlock", context.blocksPerVirtualBlock},
      {"pagesPerVirtualBlock", context.pagesPerVirtualBlock},
      {"bytesPerPage", context.bytesPerPage},
      {"hostReads", context.hostReads},
      {"hostWrites", context.hostWrites},
      {"numFreeVirtualBlocks", context.numFreeVirtualBlocks},
      {"wearLevMoves", context.wearLevMoves},
      {"nandReads", context.nandReads},
      {"nandWrites", context.nandWrites},
      {"bandErases", context.bandErases},
      {"IND_pool_free", context.IND_pool_free},
      {"IND_pool_count", context.IND_pool_count},
      {"utilFormatTime", context.utilFormatTime},
      {"numSleepOps", context.numSleepOps},
      {"maxHighEnduranceBlockErases", context.maxHighEnduranceBlockErases},
  };
}

Statistics ParseKVR(const NandExporter &row, const std::string &dump) {
  KVRStatsCxt context = {};
  Statistics statistics;
  statistics.result = static_cast<uint64_t>(
      row.parseBufferToCxt(&context, dump.data(), static_cast<uint32_t>(dump.size())));
  statistics.summary = SummaryOf(context);
  statistics.readCountHisto.assign(std::begin(context.readCountHisto),
                                   std::end(context.readCountHisto));
  statistics.entries = EntriesOf(context);
  row.releaseContext(&context);
  if (statistics.result == 0) {
    statistics.problem = "a bad record ends the statistics after " +
                         std::to_string(statistics.entries.size()) + " entries";
  }
  return statistics;
}

// For the parsers that fill a generic context and leave messages.
template <typename Parser, typename Size>
Statistics ParseGeneric(const NandExporter &row, Parser parser, const std::string &dump,
                        Size size) {
  GenericParserCxt context = {};
  Statistics statistics;
  statistics.result = parser(&context, dump.data(), size);
  statistics.entries = EntriesOf(context);
  row.releaseGenericParserCxt(&context);
  if (GlobalAPIErrorMessage != nullptr) {
    statistics.problem = GetAPIErrorMessage();
  } else if (statistics.entries.empty()) {
    statistics.problem = "no statistics found";
  }
  return statistics;
}

Statistics Parse(const NandExporter &row, const std::string &stream, const std::string &dump) {
  Statistics statistics;
  if (dump.empty()) {
    statistics.problem = "the file is empty";
  } else if (stream == "kvr") {
    statistics = ParseKVR(row, dump);
  } else if (stream == "ftl") {
    statistics =
        ParseGeneric(row, row.ftlParseBufferToCxt, dump, static_cast<uint32_t>(dump.size()));
  } else {
    statistics = ParseGeneric(row, row.mspParseBufferToCxt, dump, uint64_t{dump.size()});
  }
  // The 64-bit parsers pass over what is no whole word; a dump that ends so was cut.
  const size_t rest = stream == "msp" ? 0 : dump.size() % sizeof(uint64_t);
  if (statistics.problem.empty() && rest != 0) {
    statistics.problem = "the last " + std::to_string(rest) + " bytes are not a whole word";
  }
  return statistics;
}

// The table's row of the class, or the first one. Null, after a complaint, for an unknown class.
const NandExporter *FindRow(const std::string &className) {
  const NandExporter *row = nand_exporters;
  if (className.empty()) return row;
  std::string known;
  for (; row->className != nullptr; ++row) {
    if (className == row->className) return row;
    known += std::string(known.empty() ? "" : ", ") + row->className;
  }
  Complain("--controller " + className, "not one of " + known);
  return nullptr;
}

bool PrintAligned(Output &output, const Entries &entries, size_t width) {
  for (const auto &[name, value] : entries) {
    const std::string padding(width - std::min(width, name.size()), ' ');
    if (!output.Write(name + padding + " : " + std::to_string(value) + "\n")) return false;
  }
  return true;
}

size_t LongestName(const Entries &entries) {
  size_t longest = 0;
  for (const auto &entry : entries) longest = std::max(longest, entry.first.size());
  return longest;
}

void PrintNormal(Output &output, Statistics statistics) {
  for (size_t i = 0; i < statistics.readCountHisto.size(); ++i) {
    statistics.summary.emplace_back("readCountHisto" + std::to_string(i),
                                    statistics.readCountHisto[i]);
  }
  const size_t width = std::max(LongestName(statistics.summary), LongestName(statistics.entries));
  if (!statistics.summary.empty()) {
    output.Write("Summary\n");
    PrintAligned(output, statistics.summary, width);
    output.Write("\nStatistics\n");
  }
  PrintAligned(output, statistics.entries, width);
}

void PrintJson(Output &output, const Statistics &statistics, const StatsOptions &options,
               const NandExporter &row) {
  Json json;
  json["file"] = options.file;
  json["controller"] = row.className;
  json["stream"] = options.stream;
  json["result"] = statistics.result;
  json["message"] = nullptr;
  if (GlobalAPIErrorMessage != nullptr) json["message"] = GetAPIErrorMessage();
  if (!statistics.summary.empty()) {
    for (const auto &[name, value] : statistics.summary) json["summary"][name] = value;
    json["summary"]["readCountHisto"] = statistics.readCountHisto;
  }
  json["entries"] = Json::array();
  for (const auto &[name, value] : statistics.entries) {
    json["entries"].push_back({{"name", name}, {"value", value}});
  }
  // A file's name may be any bytes; those that are not UTF-8 are replaced.
  output.Write(json.dump(2, ' ', false, Json::error_handler_t::replace) + "\n");
}

void PrintPrometheus(Output &output, const Statistics &statistics, const StatsOptions &options,
                     const NandExporter &row) {
  output.Write(
      "# HELP morwick_statistic A statistic that the storage controller reports.\n"
      "# TYPE morwick_statistic gauge\n");
  // One sample a name: the last value, at the place of the first.
  std::map<std::string_view, uint64_t> last;
  for (const auto &[name, value] : statistics.entries) last[name] = value;
  for (const auto &[name, value] : statistics.entries) {
    const auto sample = last.extract(name);
    if (sample.empty()) continue;
    output.Write("morwick_statistic{controller=\"" + std::string(row.className) + "\",stream=\"" +
                 options.stream + "\",name=\"" + name + "\"} " + std::to_string(sample.mapped()) +
                 "\n");
  }
}

}  // namespace

Status StatsCommand(const StatsOptions &options) {
  const NandExporter *row = FindRow(options.controller);
  if (row == nullptr) return kBadUsage;
  const std::string name = DisplayName(options.file);
  if (options.stream == "msp" && row->mspParseBufferToCxt == nullptr) {
    Complain(name, std::string(row->className) + " has no MSP statistics");
    return kBadUsage;
  }
  // The parsers take 32-bit sizes.
  const std::optional<std::string> dump = ReadInput(options.file, UINT32_MAX);
  if (!dump) return kBadUsage;
  const Statistics statistics = Parse(*row, options.stream, *dump);

  Output output;
  if (options.format == "json") {
    PrintJson(output, statistics, options, *row);
  } else if (options.format == "prometheus") {
    PrintPrometheus(output, statistics, options, *row);
  } else {
    PrintNormal(output, statistics);
  }
  if (!statistics.problem.empty()) Complain(name, statistics.problem);
  return output.Finish(statistics.problem.empty() ? kGood : kBadData);
}

}  // namespace tools
