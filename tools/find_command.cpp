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
  std::vector<std::string_view> offers;  // the names of its buffers

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
    for (const std::string_view name : finding.offers) line += fmt::format(" {}", name);
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
    json.Array("offers", finding.offers, [&](std::string_view name) { json.PlainText(name); });
  });
  return json.Finish(status);
}

Status Find(Format format) {
  std::vector<Finding> findings;
  Status status = kBadData;
  for (const NandExporter &row : fleet::KnownControllers()) {
    Finding finding = {&row, fleet::Probe(row), {}};
    if (finding.presence.opened) status = kGood;
    for (const fleet::BufferKind &kind : fleet::BufferKinds()) {
      if (row.*kind.selectors != nullptr) finding.offers.push_back(kind.name);
    }
    findings.push_back(std::move(finding));
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
