// The beginning and the end that all JSON objects have.

#include "tools/json.h"

#include <array>

#include "tools/text.h"

namespace tools {

Json::Json(Output &output, std::string_view command, const std::vector<Source> &sources)
    : stream_{output} {
  if (!reserve_.IsHeld()) ThrowOutOfMemory();
  BeginObject();
  Array("format_version", std::array{1U, 0U}, [&](uint32_t part) { Number(part); });
  Member("morwick", MORWICK_VERSION);
  Member("platform", MORWICK_PLATFORM_NAME);
  Member("command", command);
  if (sources.empty()) return;
  Object("source", [&] {
    for (const Source &source : sources) {
      Key(source.kind);
      source.kind == "controller" && source.name.empty() ? Null() : Text(source.name);
    }
  });
}

// Valid text is not copied, so that an object can be ended when memory is refused.
void Json::Text(std::string_view text) {
  IsValidText(text) ? PlainText(text) : PlainText(ValidText(text));
}

Status Json::Finish(Status status) {
  if (TakeMemoryRefusal()) {
    ComplainOfMemory();
    status = kBadData;
  }
  Objects("messages", TakeMessages(), [&](const Message &message) {
    Member("severity", message.severity);
    Member("text", message.text);
  });
  Member("status", static_cast<uint32_t>(status));
  EndObject();
  stream_.output.Put('\n');
  return status;
}

}  // namespace tools
