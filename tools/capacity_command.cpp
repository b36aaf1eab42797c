// morwick capacity: prints advertised capacities.

#include <memory>

#include "morwick/capacity.h"
#include "tools/commands.h"
#include "tools/json.h"
#include "tools/options.h"
#include "tools/text.h"

namespace tools {
namespace {

struct Options {
  std::vector<uint32_t> megabytes;
  Format format = Format::kNormal;
};

Status PrintCapacities(const Options &options) {
  Output output;
  if (options.format == Format::kJson) {
    Json json(output, "capacity");
    json.Objects("capacities", options.megabytes, [&](uint32_t megabytes) {
      json.Member("megabytes", megabytes);
      json.Member("gigabytes", GetUserCapacityInGB(megabytes));
    });
    return output.Finish(json.Finish(kGood));
  }
  for (const uint32_t megabytes : options.megabytes) {
    output.Write(std::to_string(GetUserCapacityInGB(megabytes)) + "\n");
  }
  return output.Finish(kGood);
}

}  // namespace

void AddCapacity(CLI::App &app, Action *action) {
  CLI::App *command =
      app.add_subcommand("capacity", "Print advertised capacities in GB for capacities in MB");
  const auto options = std::make_shared<Options>();
  const auto take = [=](const std::vector<std::string> &texts) {
    for (const std::string &text : texts) {
      const auto number = ParseNumber<uint32_t>(text, 0, UINT32_MAX);
      if (!number)
        throw CLI::ValidationError("MB", text + " is not a whole number up to 4294967295");
      options->megabytes.push_back(*number);
    }
  };
  command->add_option_function<std::vector<std::string>>("MB", take, "Capacities in megabytes")
      ->required();
  AddFormat(command, &options->format, {Format::kNormal, Format::kJson});
  command->callback([=] { *action = [=] { return PrintCapacities(*options); }; });
}

}  // namespace tools
