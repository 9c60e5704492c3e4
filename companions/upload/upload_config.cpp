#include "companions/upload/upload_config.h"

#include <algorithm>
#include <functional>

#include "companions/upload/http_text.h"
#include "core/ascii.h"
#include "core/json.h"

namespace qxlink {
namespace {

constexpr uint64_t kLongestTimeout = 86'400;           // seconds
constexpr uint64_t kLongestUpload = 604'800;           // seconds
constexpr uint64_t kLargestChunk = uint64_t{1} << 30;  // bytes
constexpr size_t kMostHeaders = 32;

// Headers that the upload itself sets.
constexpr std::string_view kOwnHeaders[] = {
    "Connection",        "Content-Length",         "Content-Type",       "Expect",        "Host",
    "Transfer-Encoding", "Tus-Resumable",          "Upload-Checksum",    "Upload-Length", "Upload-Metadata",
    "Upload-Offset",     "X-HTTP-Method-Override", "Proxy-Authorization"};

bool HasControlCharacter(std::string_view text) {
  return std::any_of(text.begin(), text.end(), [](unsigned char c) { return c < ' ' || c == 0x7F; });
}

// Empty when the address is fine.
std::string AddressProblem(const std::string& name, std::string_view text, bool allowPlainHttp) {
  const auto address = ParseHttpAddress(text);
  if (!StartsWithIgnoringCase(text, "https://") && !StartsWithIgnoringCase(text, "http://"))
    return "\"" + name + "\" is not an https:// address";
  if (text.find('@') != std::string_view::npos) {
    return "\"" + name + "\" holds a user name; credentials belong into \"headers\"";
  }
  if (!address) return "\"" + name + "\" names no host, or holds what no address can";
  if (!address->isSecure && !allowPlainHttp) {
    return "\"" + name + "\" is an http:// address, which \"allow_plain_http\" does not allow";
  }
  return {};
}

class ConfigReader {
 public:
  explicit ConfigReader(ParsedUploadConfig& parsed) : m_parsed(parsed), m_config(parsed.config) {}

  void Read(const Json::Value& document) {
    ReadMembers(
        document, "",
        {{"endpoint", [this](const auto& name, const auto& value) { ReadText(name, value, m_config.endpoint); }},
         {"messages", [this](const auto& name, const auto& value) { ReadText(name, value, m_config.messages); }},
         {"headers", [this](const auto&, const auto& value) { ReadHeaders(value); }},
         {"ca_file", [this](const auto& name, const auto& value) { ReadText(name, value, m_config.caFile); }},
         {"proxy", [this](const auto& name, const auto& value) { ReadText(name, value, m_config.proxy); }},
         {"chunk_size",
          [this](const auto& name, const auto& value) {
            ReadWhole(name, value, 1 << 10, kLargestChunk, m_config.chunkSize);
          }},
         {"timeouts", [this](const auto&, const auto& value) { ReadTimeouts(value); }},
         {"retries",
          [this](const auto& name, const auto& value) {
            uint64_t retries = m_config.retries;
            ReadWhole(name, value, 0, 1000, retries);
            m_config.retries = static_cast<unsigned>(retries);
          }},
         {"retry_delay",
          [this](const auto& name, const auto& value) { ReadSeconds(name, value, 3600, m_config.retryDelay); }},
         {"outbox", [this](const auto& name, const auto& value) { ReadText(name, value, m_config.outbox); }},
         {"keep_in_outbox_on_failure",
          [this](const auto& name, const auto& value) { ReadFlag(name, value, m_config.keepInOutboxOnFailure); }},
         {"allow_plain_http",
          [this](const auto& name, const auto& value) { ReadFlag(name, value, m_config.allowPlainHttp); }}});
  }

  // What several members have to say together.
  void Check() {
    const std::pair<const char*, const std::string*> addresses[] = {{"endpoint", &m_config.endpoint},
                                                                    {"messages", &m_config.messages}};
    for (const auto& [name, text] : addresses) {
      if (text->empty()) continue;
      std::string problem = AddressProblem(name, *text, m_config.allowPlainHttp);
      if (!problem.empty()) m_parsed.problems.push_back(std::move(problem));
    }
    if (m_config.outbox.empty() || HasControlCharacter(m_config.outbox)) Problem("outbox", "names no folder");
    if (HasControlCharacter(m_config.caFile)) Problem("ca_file", "names no file");
    const std::string& proxy = m_config.proxy;
    const auto address = ParseHttpAddress("http://" + proxy);
    if (proxy != "system" && proxy != "none" && (!address || address->target != "/" || proxy.ends_with('/'))) {
      Problem("proxy", "is neither \"system\" nor \"none\" nor a host with a port");
    }
  }

 private:
  using Reader = std::function<void(const std::string& name, const Json::Value& value)>;

  void ReadMembers(const Json::Value& object, const std::string& prefix,
                   const std::vector<std::pair<std::string, Reader>>& readers) {
    for (const std::string& name : object.getMemberNames()) {
      const auto reader = std::find_if(readers.begin(), readers.end(), [&](const auto& r) { return r.first == name; });
      if (reader != readers.end()) {
        reader->second(prefix + name, object[name]);
      } else {
        m_parsed.unknownMembers.push_back(prefix + name);
      }
    }
  }

  void Problem(const std::string& name, const std::string& what) {
    m_parsed.problems.push_back("\"" + name + "\" " + what);
  }

  void ReadText(const std::string& name, const Json::Value& value, std::string& text) {
    if (!value.isString()) return Problem(name, "is not a text");
    text = value.asString();
  }

  void ReadFlag(const std::string& name, const Json::Value& value, bool& flag) {
    if (!value.isBool()) return Problem(name, "is neither true nor false");
    flag = value.asBool();
  }

  void ReadWhole(const std::string& name, const Json::Value& value, uint64_t least, uint64_t most, uint64_t& number) {
    if (!value.isUInt64() || value.asUInt64() < least || value.asUInt64() > most) {
      return Problem(name, "is no whole number from " + std::to_string(least) + " to " + std::to_string(most));
    }
    number = value.asUInt64();
  }

  // Fractions too; `milliseconds` is what is kept.
  void ReadSeconds(const std::string& name, const Json::Value& value, uint64_t most, uint64_t& milliseconds) {
    const double seconds = value.isNumeric() ? value.asDouble() : -1;
    if (!(seconds >= 0.01 && seconds <= static_cast<double>(most))) {
      return Problem(name, "is no number of seconds from 0.01 to " + std::to_string(most));
    }
    milliseconds = static_cast<uint64_t>(seconds * 1000);
  }

  void ReadTimeouts(const Json::Value& value) {
    if (!value.isObject()) return Problem("timeouts", "is not an object");
    const auto reader = [this](uint64_t most, uint64_t& milliseconds) {
      return [this, most, &milliseconds](const auto& name, const auto& member) {
        ReadSeconds(name, member, most, milliseconds);
      };
    };
    UploadTimeouts& timeouts = m_config.timeouts;
    ReadMembers(value, "timeouts.",
                {{"connect", reader(kLongestTimeout, timeouts.connect)},
                 {"send", reader(kLongestTimeout, timeouts.send)},
                 {"receive", reader(kLongestTimeout, timeouts.receive)},
                 {"upload", reader(kLongestUpload, timeouts.upload)}});
  }

  void ReadHeaders(const Json::Value& value) {
    if (!value.isObject() || value.size() > kMostHeaders) {
      return Problem("headers", "is not an object of at most " + std::to_string(kMostHeaders) + " texts");
    }
    for (const std::string& name : value.getMemberNames()) {
      const bool isOwn = std::any_of(std::begin(kOwnHeaders), std::end(kOwnHeaders),
                                     [&](std::string_view own) { return EqualIgnoringCase(own, name); });
      if (!IsHeaderName(name) || isOwn) return Problem("headers", "names a header that cannot be set");
      if (!value[name].isString() || !IsHeaderValue(value[name].asString())) {
        return Problem("headers", "holds a value that is no text of printable ASCII characters");
      }
      m_config.headers.emplace_back(name, value[name].asString());
    }
  }

  ParsedUploadConfig& m_parsed;
  UploadConfig& m_config;
};

}  // namespace

ParsedUploadConfig ParseUploadConfig(std::string_view json) {
  ParsedUploadConfig parsed;
  Json::Value document;
  std::string error;
  if (!ParseJson(json, document, error)) {
    parsed.problems.emplace_back("it is not a JSON document");
    return parsed;
  }
  if (!document.isObject()) {
    parsed.problems.emplace_back("it is not a JSON object");
    return parsed;
  }
  ConfigReader reader(parsed);
  reader.Read(document);
  reader.Check();
  return parsed;
}

}  // namespace qxlink
