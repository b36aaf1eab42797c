// morwick stats: prints the statistics of a controller or of a dump.

#include <fmt/format.h>

#include <algorithm>
#include <memory>

#include "tools/aligned_table.h"
#include "tools/commands.h"
#include "tools/input.h"
#include "tools/options.h"
#include "tools/statistics.h"
#include "tools/text.h"

namespace tools {
namespace {

struct Options : StreamOptions {
  std::string file;
  bool live = true;
  bool summary = false;
  bool inFull = false;
};

// The length of the label of a group: "name", or "name[0..9]" for an array.
size_t LabelLength(const EntryGroup &group) {
  return group.base.size() +
         (group.IsArray() ? fmt::formatted_size("[0..{}]", group.count - 1) : 0);
}

// Prints the label, left-aligned in the width of the longest one.
void PrintLabel(Output &output, std::string_view label, size_t width) {
  static const std::string blanks(sizeof(ContextNode::text) + 32, ' ');  // a name and [0..N]
  output.Write(label);
  output.Write(std::string_view(blanks).substr(0, width - label.size()));
  output.Write(" : ");
}

// Prints one line for each group, so also for each array.
void PrintGroups(Output &output, const Statistics &statistics) {
  size_t width = 0;
  for (EntryIterator next = statistics.begin(); const auto group = TakeGroup(&next);) {
    width = std::max(width, LabelLength(*group));
  }
  for (EntryIterator next = statistics.begin(); const auto group = TakeGroup(&next);) {
    if (group->IsArray()) {
      PrintLabel(output, fmt::format("{}[0..{}]", group->base, group->count - 1), width);
    } else {
      PrintLabel(output, group->base, width);
    }
    group->ForEach([&](const Entry &entry, size_t i) {
      if (i > 0) output.Put(' ');
      output.Write(entry.digits());
    });
    output.Put('\n');
  }
}

void PrintEntries(Output &output, const Statistics &statistics) {
  size_t width = 0;
  for (const Entry &entry : statistics) width = std::max(width, entry.name().size());
  for (const Entry &entry : statistics) {
    PrintLabel(output, entry.name(), width);
    output.Write(entry.digits());
    output.Put('\n');
  }
}

void PrintSummary(Output &output, const Statistics &statistics) {
  AlignedTable table(1, 1);
  for (const fleet::Figure &figure : SummaryOf(statistics)) {
    table.Add(
        {std::string(figure.name), fmt::format(": {}{}", fmt::join(figure.values, " "),
                                               figure.ratio ? ThreeDecimals(*figure.ratio) : "")});
  }
  table.Print(output);
}

void PrintCsv(Output &output, const Statistics &statistics) {
  output.Write("name,value\n");
  for (const Entry &entry : statistics) {
    output.Write(entry.name());
    output.Put(',');
    output.Write(entry.digits());
    output.Put('\n');
  }
}

void PrintJsonSummary(Json &json, const Statistics &statistics) {
  json.Object("summary", [&] {
    for (const fleet::Figure &figure : SummaryOf(statistics)) {
      if (figure.ratio) {
        json.Key(figure.name);
        json.Digits(ThreeDecimals(*figure.ratio));
        continue;
      }
      json.Numbers(figure.name, figure.values.size() > 1, [&](auto print) {
        for (const uint64_t value : figure.values) print(value, std::to_string(value));
      });
    }
  });
}

void PrintJsonEntries(Json &json, const Statistics &statistics) {
  json.Key("entries");
  json.BeginArray();
  for (EntryIterator next = statistics.begin(); const auto group = TakeGroup(&next);) {
    json.BeginObject();
    json.Key("name");
    json.PlainText(group->base);
    json.Numbers(group->IsArray() ? "values" : "value", group->IsArray(), [&](auto print) {
      group->ForEach([&](const Entry &entry, size_t) { print(entry.value(), entry.digits()); });
    });
    json.EndObject();
  }
  json.EndArray();
}

Status PrintJson(Output &output, const Options &options, const Dump &dump,
                 const std::optional<Statistics> &statistics) {
  Json json(output, "stats", {dump.source});
  json.Member("stream", fleet::NameOf(options.stream));
  Status status = dump.status;
  if (statistics) {
    json.Member("result", statistics->result());
    if (options.stream == kMorwickKVR) PrintJsonSummary(json, *statistics);
    PrintJsonEntries(json, *statistics);
    status = statistics->Check(dump);
  }
  return json.Finish(status);
}

Status Print(const Options &options) {
  const Dump dump = options.live ? ReadDumpLive(options.stream, options.className)
                                 : ReadDumpFile(options.file, options.stream, options.className);
  if (options.live) NoteUnreadInput();
  std::optional<Statistics> statistics;
  if (dump.bytes) statistics.emplace(dump, options.stream, options.filter);
  Output output;
  if (options.format == Format::kJson) {
    return output.Finish(PrintJson(output, options, dump, statistics));
  }
  if (!statistics) return output.Finish(dump.status);
  if (options.format == Format::kCsv) {
    PrintCsv(output, *statistics);
  } else if (options.summary) {
    PrintSummary(output, *statistics);
  } else if (options.inFull) {
    PrintEntries(output, *statistics);
  } else {
    PrintGroups(output, *statistics);
  }
  output.Flush();
  return output.Finish(statistics->Check(dump));
}

}  // namespace

void AddStats(CLI::App &app, Action *action) {
  CLI::App *command =
      app.add_subcommand("stats", "Print the statistics of a controller, or in a dump");
  const auto options = std::make_shared<Options>();
  CLI::Option *file =
      command->add_option("FILE", options->file, "A dump; - for standard input")->type_name("");
  AddStream(command, &options->stream);
  AddNames(command, &options->names);
  AddController(command, &options->className,
                "Read from this one instead of the first; with FILE, where the dump is from");
  CLI::Option *summary = command->add_flag("--summary", options->summary,
                                           "Only the main figures; kvr and normal output only");
  command
      ->add_flag("--long", options->inFull,
                 "Each element of an array on a line of its own; normal output only")
      ->excludes(summary);
  AddFormat(command, &options->format, {Format::kNormal, Format::kJson, Format::kCsv});
  command->callback([=] {
    options->live = file->count() == 0;
    options->filter = MakeFilter({&options->stream, 1}, options->names);
    const bool normal = options->format == Format::kNormal;
    if (options->summary && (options->stream != kMorwickKVR || !normal)) {
      throw CLI::ValidationError("--summary", "is for kvr and normal output");
    }
    if (options->inFull && !normal) {
      throw CLI::ValidationError("--long", "is for normal output");
    }
    *action = [=] { return Print(*options); };
  });
}

}  // namespace tools
