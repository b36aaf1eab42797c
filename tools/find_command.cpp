// morwick find: lists the controllers and the buffers that they offer.

#include <fmt/format.h>

#include <memory>

#include "fleet/controllers.h"
#include "tools/aligned_table.h"
#include "tools/commands.h"
#include "tools/json.h"
#include "tools/options.h"

namespace tools {
namespace {

struct Finding {
  const NandExporter *row;
  fleet::Presence presence;

  std::string_view State() const {
    return !presence.present ? "absent" : presence.opened ? "present" : "refusing";
  }
};

// One line for each class, with aligned states.
void PrintNormal(Output &output, const std::vector<Finding> &findings) {
  AlignedTable table(1, 1);
  for (const Finding &finding : findings) {
    std::string line = fmt::format(": {}", finding.State());
    if (finding.presence.present && !finding.presence.opened) {
      line += ", result " + fleet::Hexadecimal(finding.presence.result);
    }
    line += ", offers";
    for (const fleet::BufferKind &kind : fleet::BufferKinds()) {
      if (finding.row->*kind.selectors != nullptr) line += fmt::format(" {}", kind.name);
    }
    table.Add({finding.row->className, line});
  }
  table.Print(output);
}

Status PrintJson(Output &output, const std::vector<Finding> &findings, Status status) {
  Json json(output, "find");
  json.Objects("controllers", findings, [&](const Finding &finding) {
    json.Member("class", finding.row->className);
    json.Member("state", finding.State());
    if (finding.presence.present) {
      json.Member("result", static_cast<uint32_t>(finding.presence.result));
    }
    json.Key("offers");
    json.BeginArray();
    for (const fleet::BufferKind &kind : fleet::BufferKinds()) {
      if (finding.row->*kind.selectors != nullptr) json.PlainText(kind.name);
    }
    json.EndArray();
  });
  return json.Finish(status);
}

Status Find(Format format) {
  std::vector<Finding> findings;
  Status status = kBadData;
  for (const NandExporter &row : fleet::KnownControllers()) {
    findings.push_back({&row, fleet::Probe(row)});
    if (findings.back().presence.opened) status = kGood;
  }
  Output output;
  if (format == Format::kJson) {
    status = PrintJson(output, findings, status);
  } else {
    PrintNormal(output, findings);
  }
  return output.Finish(status);
}

}  // namespace

void AddFind(CLI::App &app, Action *action) {
  CLI::App *command =
      app.add_subcommand("find", "Say which controllers there are and what they offer");
  const auto format = std::make_shared<Format>();
  AddFormat(command, format.get(), {Format::kNormal, Format::kJson});
  command->callback([=] { *action = [=] { return Find(*format); }; });
}

}  // namespace tools
