// morwick stats: prints the statistics of a controller or in a dump.

#include <algorithm>
#include <memory>

#include "tools/commands.h"
#include "tools/options.h"
#include "tools/statistics.h"

namespace tools {
namespace {

struct Options {
  std::string file;
  bool live = true;
  std::string stream;
  std::string className;
  std::string format;
  bool summary = false;
  bool inFull = false;
};

// "name[0..9]" for an array; as many characters as it has.
size_t LabelLength(const EntryGroup &group) {
  if (!group.IsArray()) return group.base.size();
  return group.base.size() + std::string_view("[0..]").size() +
         std::to_string(group.count - 1).size();
}

void PrintLabel(Output &output, std::string_view label, size_t length, size_t width) {
  static const std::string blanks(sizeof(ContextNode::text) + 32, ' ');
  output.Write(label);
  output.Write(std::string_view(blanks).substr(0, width - length));
  output.Write(" : ");
}

// An array in one line.
void PrintGroups(Output &output, const Statistics &statistics) {
  size_t width = 0;
  for (EntryReader reader(statistics); !reader.AtEnd();) {
    width = std::max(width, LabelLength(reader.TakeGroup()));
  }
  for (EntryReader reader(statistics); !reader.AtEnd();) {
    const EntryGroup group = reader.TakeGroup();
    if (group.IsArray()) {
      const std::string label =
          std::string(group.base) + "[0.." + std::to_string(group.count - 1) + "]";
      PrintLabel(output, label, label.size(), width);
    } else {
      PrintLabel(output, group.base, group.base.size(), width);
    }
    const ContextNode *value = group.value;
    for (size_t i = 0; i < group.count; ++i, value = value->next) {
      if (i > 0) output.Put(' ');
      output.Write(value->text);
    }
    output.Put('\n');
  }
}

void PrintEntries(Output &output, const Statistics &statistics) {
  size_t width = 0;
  for (const ContextNode *name = statistics.names(); name != nullptr; name = name->next) {
    width = std::max(width, std::string_view(name->text).size());
  }
  const ContextNode *value = statistics.values();
  for (const ContextNode *name = statistics.names(); name != nullptr; name = name->next) {
    PrintLabel(output, name->text, std::string_view(name->text).size(), width);
    output.Write(value->text);
    output.Put('\n');
    value = value->next;
  }
}

void PrintSummary(Output &output, const Statistics &statistics) {
  const std::vector<SummaryField> fields = SummaryOf(statistics);
  size_t width = 0;
  for (const SummaryField &field : fields) width = std::max(width, field.name.size());
  for (const SummaryField &field : fields) {
    PrintLabel(output, field.name, field.name.size(), width);
    for (size_t i = 0; i < field.values.size(); ++i) {
      output.Write((i > 0 ? " " : "") + std::to_string(field.values[i]));
    }
    output.Put('\n');
  }
}

void PrintCsv(Output &output, const Statistics &statistics) {
  output.Write("name,value\n");
  const ContextNode *value = statistics.values();
  for (const ContextNode *name = statistics.names(); name != nullptr; name = name->next) {
    output.Write(name->text);
    output.Put(',');
    output.Write(value->text);
    output.Put('\n');
    value = value->next;
  }
}

void PrintJsonSummary(Json &json, const Statistics &statistics) {
  json.Key("summary");
  json.BeginObject();
  for (const SummaryField &field : SummaryOf(statistics)) {
    json.Numbers(field.name, field.values.size() > 1, [&](auto print) {
      for (const uint64_t value : field.values) print(value, std::to_string(value));
    });
  }
  json.EndObject();
}

void PrintJsonValues(Json &json, const EntryGroup &group) {
  json.Numbers(group.IsArray() ? "values" : "value", group.IsArray(), [&](auto print) {
    const ContextNode *value = group.value;
    for (size_t i = 0; i < group.count; ++i, value = value->next) print(value->value, value->text);
  });
}

void PrintJsonEntries(Json &json, const Statistics &statistics) {
  json.Key("entries");
  json.BeginArray();
  for (EntryReader reader(statistics); !reader.AtEnd();) {
    const EntryGroup group = reader.TakeGroup();
    json.BeginObject();
    json.Key("name");
    json.PlainText(group.base);
    PrintJsonValues(json, group);
    json.EndObject();
  }
  json.EndArray();
}

Status PrintJson(Output &output, const Options &options, const Dump &dump,
                 const Statistics *statistics) {
  Json json(output, "stats", {dump.source});
  json.Member("stream", options.stream);
  Status status = dump.status;
  if (statistics != nullptr) {
    json.Member("result", statistics->result());
    if (options.stream == "kvr") PrintJsonSummary(json, *statistics);
    PrintJsonEntries(json, *statistics);
    status = statistics->Judge(dump);
  }
  return json.Finish(status);
}

Status PrintText(Output &output, const Options &options, const Dump &dump,
                 const Statistics &statistics) {
  if (options.format == "csv") {
    PrintCsv(output, statistics);
  } else if (options.summary) {
    PrintSummary(output, statistics);
  } else if (options.inFull) {
    PrintEntries(output, statistics);
  } else {
    PrintGroups(output, statistics);
  }
  output.Flush();
  return statistics.Judge(dump);
}

Status Print(const Options &options) {
  const Dump dump = options.live ? ReadDumpLive(options.stream, options.className)
                                 : ReadDumpFile(options.file, options.stream, options.className);
  std::optional<Statistics> statistics;
  if (dump.status == kGood) statistics.emplace(dump, options.stream);
  Output output;
  Status status = dump.status;
  if (options.format == "json") {
    status = PrintJson(output, options, dump, statistics ? &*statistics : nullptr);
  } else if (statistics) {
    status = PrintText(output, options, dump, *statistics);
  }
  return output.Finish(status);
}

}  // namespace

void AddStats(CLI::App &app, Action *action) {
  CLI::App *command =
      app.add_subcommand("stats", "Print the statistics of a controller, or in a dump");
  const auto options = std::make_shared<Options>();
  CLI::Option *file =
      command->add_option("FILE", options->file, "A dump; - for standard input")->type_name("");
  AddStream(command, &options->stream);
  AddController(command, &options->className,
                "Read from this one instead of the first; with FILE, where the dump is from");
  CLI::Option *summary = command->add_flag("--summary", options->summary,
                                           "Only the main figures; kvr and normal output only");
  command
      ->add_flag("--long", options->inFull,
                 "Each element of an array on a line of its own; normal output only")
      ->excludes(summary);
  AddFormat(command, &options->format, {"normal", "json", "csv"});
  command->callback([=] {
    options->live = file->count() == 0;
    if (options->summary && (options->stream != "kvr" || options->format != "normal")) {
      throw CLI::ValidationError("--summary", "is for kvr and normal output");
    }
    if (options->inFull && options->format != "normal") {
      throw CLI::ValidationError("--long", "is for normal output");
    }
    *action = [=] { return Print(*options); };
  });
}

}  // namespace tools
