// The JSON frame: what every object begins and ends with.

#include "tools/json.h"

#include "tools/text.h"

namespace tools {

Json::Json(Output &output, std::string_view command, const std::vector<Source> &sources)
    : stream_{output} {
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
    if (source.kind == "controller" && source.name.empty()) {
      Key(source.kind);
      Null();
    } else {
      Member(source.kind, source.name);
    }
  }
  EndObject();
}

// No copy of what is good as it is: an object is ended also where memory is refused.
void Json::Text(std::string_view text) {
  IsValidText(text) ? PlainText(text) : PlainText(ValidText(text));
}

void Json::Finish(Status status) {
  Key("messages");
  BeginArray();
  for (const Message &message : Messages()) {
    BeginObject();
    Member("severity", message.severity);
    Member("text", message.text);
    EndObject();
  }
  EndArray();
  ForgetMessages();
  Member("status", static_cast<uint32_t>(status));
  EndObject();
  stream_.output.Put('\n');
}

}  // namespace tools
