// The beginning and the end that all JSON objects have.

#include "tools/json.h"

#include "tools/text.h"

namespace tools {

Json::Json(Output &output, std::string_view command, const std::vector<Source> &sources)
    : stream_{output} {
  if (!reserve_.IsHeld()) RefuseMemory();
  BeginObject();
  Key("format_version");
  BeginArray();
  Number(1U);
  Number(0U);
  EndArray();
  Member("morwick", MORWICK_VERSION);
  Member("platform", MORWICK_PLATFORM_NAME);
  Member("command", command);
  if (sources.empty()) return;
  Key("source");
  BeginObject();
  for (const Source &source : sources) {
    Key(source.kind);
    source.kind == "controller" && source.name.empty() ? Null() : Text(source.name);
  }
  EndObject();
}

// Valid text is not copied, so that an object can be ended when memory is refused.
void Json::Text(std::string_view text) {
  IsValidText(text) ? PlainText(text) : PlainText(ValidText(text));
}

void Json::PrintMessage(std::string_view severity, std::string_view text) {
  BeginObject();
  Member("severity", severity);
  Member("text", text);
  EndObject();
}

Status Json::Finish(Status status) {
  if (TakeMemoryRefusal()) {
    ComplainOfMemory();
    status = kBadData;
  }
  Key("messages");
  BeginArray();
  for (const Message &message : KeptMessages()) PrintMessage(message.severity, message.text);
  if (LeftOutMessages() > 0) {
    PrintMessage("note", std::to_string(LeftOutMessages()) + " more messages are left out here");
  }
  EndArray();
  ForgetMessages();
  Member("status", static_cast<uint32_t>(status));
  EndObject();
  stream_.output.Put('\n');
  return status;
}

}  // namespace tools
