#include "JsonFormat.h"

#include <cmath>

#include "PathText.h"
#include "ReturnCodes.h"
#include "text/Text.h"

namespace bluelight::cli {

using cmpihost::Value;

namespace {

std::string elementTypeName(CMPIType type) {
  switch (type) {
    case CMPI_boolean:
      return "boolean";
    case CMPI_char16:
      return "char16";
    case CMPI_uint8:
      return "uint8";
    case CMPI_uint16:
      return "uint16";
    case CMPI_uint32:
      return "uint32";
    case CMPI_uint64:
      return "uint64";
    case CMPI_sint8:
      return "sint8";
    case CMPI_sint16:
      return "sint16";
    case CMPI_sint32:
      return "sint32";
    case CMPI_sint64:
      return "sint64";
    case CMPI_real32:
      return "real32";
    case CMPI_real64:
      return "real64";
    case CMPI_string:
      return "string";
    case CMPI_dateTime:
      return "datetime";
    case CMPI_ref:
      return "reference";
    case CMPI_instance:
      return "instance";
    case CMPI_null:
      return "null";
    default:
      return cmpihost::typeName(type);
  }
}

// A char16 value holds one 16-bit unit; it is written as formatKeyValue writes it in paths, a
// surrogate included.
std::string char16Text(CMPIUint64 code) {
  std::string text;
  Kesta::platform::appendUtf8KeepingSurrogates(text, static_cast<char16_t>(code));
  return text;
}

}  // namespace

std::string cimTypeName(const Value& value) {
  return elementTypeName(value.elementType()) + (value.isArray() ? "[]" : "");
}

Json jsonValue(const Value& value) {
  if (value.isNull()) return nullptr;
  if (value.isArray()) {
    Json array = Json::array();
    for (const Value& element : value.elements()) array.push_back(jsonValue(element));
    return array;
  }
  switch (value.type()) {
    case CMPI_boolean:
      return value.asBoolean();
    case CMPI_char16:
      return char16Text(value.asUnsigned());
    case CMPI_uint8:
    case CMPI_uint16:
    case CMPI_uint32:
    case CMPI_uint64:
      return value.asUnsigned();
    case CMPI_sint8:
    case CMPI_sint16:
    case CMPI_sint32:
    case CMPI_sint64:
      return value.asSigned();
    case CMPI_real32:
    case CMPI_real64: {
      const double real = value.asReal();
      if (!std::isfinite(real)) return nullptr;
      return real;
    }
    case CMPI_string:
    case CMPI_dateTime:
      return value.asString();
    case CMPI_ref:
      return formatPath(value.asReference());
    case CMPI_instance:
      return jsonInstance(value.asInstance());
    default:
      return value.toString();
  }
}

Json jsonStatus(const cmpihost::StatusValue& status) {
  Json json = Json::object();
  json["code"] = static_cast<int>(status.rc);
  json["name"] = returnCodeName(status.rc);
  json["message"] = status.message ? Json(*status.message) : Json(nullptr);
  return json;
}

Json jsonInstance(const cmpihost::InstanceValue& instance) {
  Json properties = Json::object();
  Json types = Json::object();
  for (const cmpihost::Property& property : instance.properties()) {
    properties[property.name] = jsonValue(property.value);
    types[property.name] = cimTypeName(property.value);
  }
  Json json = Json::object();
  json["path"] = formatPath(instance.path());
  json["class"] = instance.className();
  json["properties"] = std::move(properties);
  json["types"] = std::move(types);
  return json;
}

Json jsonReport(const Report& report) {
  Json json = Json::object();
  json["operation"] = infoOf(report.operation).cimName;
  json["target"] = formatPath(report.target);
  json["status"] = jsonStatus(report.status);
  Json providers = Json::array();
  for (const ProviderRun& run : report.runs) {
    Json entry = Json::object();
    entry["provider"] = run.provider;
    entry["mi"] = toString(run.kind);
    entry["status"] = jsonStatus(run.outcome.status);
    entry["results"] = run.outcome.results.size() - run.outcome.count(cmpihost::ResultKind::Done);
    entry["doneCalls"] = run.outcome.doneCount;
    providers.push_back(std::move(entry));
  }
  json["providers"] = std::move(providers);
  Json instances = Json::array();
  for (const cmpihost::InstanceValue& instance : report.instances) {
    instances.push_back(jsonInstance(instance));
  }
  json["instances"] = std::move(instances);
  Json paths = Json::array();
  for (const cmpihost::ObjectPathValue& path : report.paths) paths.push_back(formatPath(path));
  json["paths"] = std::move(paths);
  json["notes"] = report.notes;
  return json;
}

}  // namespace bluelight::cli
