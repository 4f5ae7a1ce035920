#include "DeployFiles.h"

#include <sys/wait.h>

#include <algorithm>
#include <array>
#include <cstdio>
#include <filesystem>
#include <fstream>
#include <map>
#include <regex>
#include <sstream>
#include <stdexcept>

namespace deploy {

namespace fs = std::filesystem;

namespace {

std::string strip(const std::string& text) {
  const std::size_t first = text.find_first_not_of(" \t\r\n");
  if (first == std::string::npos) return std::string();
  const std::size_t last = text.find_last_not_of(" \t\r\n");
  return text.substr(first, last - first + 1);
}

std::vector<std::string> words(const std::string& text) {
  std::istringstream in(text);
  std::vector<std::string> result;
  for (std::string word; in >> word;) result.push_back(word);
  return result;
}

std::vector<std::string> filesIn(const std::string& directory, const std::string& suffix) {
  std::vector<std::string> files;
  std::error_code error;
  for (const auto& entry : fs::directory_iterator(directory, error)) {
    const std::string name = entry.path().filename().string();
    if (name.size() > suffix.size() &&
        name.compare(name.size() - suffix.size(), suffix.size(), suffix) == 0) {
      files.push_back(entry.path().string());
    }
  }
  std::sort(files.begin(), files.end());
  return files;
}

}  // namespace

std::string Registration::summary() const {
  std::ostringstream out;
  out << className << " provider=" << provider << " location=" << location << " kinds=";
  for (const std::string& kind : kinds) out << kind << ' ';
  out << "namespaces=";
  for (const std::string& ns : namespaces) out << ns << ' ';
  return out.str();
}

std::string TableRow::summary() const {
  Registration registration;
  registration.className = className;
  registration.provider = provider;
  registration.location = library;
  registration.kinds = kinds;
  registration.namespaces = namespaces;
  return registration.summary();
}

std::vector<TableRow> providerTable() {
  const std::string table = std::string(BLUELIGHT_DEPLOY_SOURCE_DIR) + "/providers.txt";
  std::istringstream in(readText(table));
  std::vector<TableRow> rows;
  int number = 0;
  for (std::string line; std::getline(in, line);) {
    ++number;
    line = strip(line);
    if (line.empty() || line.front() == '#') continue;
    const std::vector<std::string> fields = words(line);
    if (fields.size() != 6) {
      throw std::runtime_error(table + ":" + std::to_string(number) + ": expected 6 columns");
    }
    TableRow row;
    row.className = fields[0];
    row.provider = fields[1];
    const std::vector<std::string> kinds = splitList(fields[2]);
    row.kinds.insert(kinds.begin(), kinds.end());
    row.library = fields[3];
    const std::vector<std::string> namespaces = splitList(fields[4]);
    row.namespaces.insert(namespaces.begin(), namespaces.end());
    row.symbol = fields[5];
    row.line = number;
    rows.push_back(std::move(row));
  }
  return rows;
}

std::vector<std::string> splitList(const std::string& text) {
  std::vector<std::string> items;
  std::istringstream in(text);
  for (std::string item; std::getline(in, item, ',');) {
    item = strip(item);
    if (!item.empty()) items.push_back(item);
  }
  return items;
}

std::string readText(const std::string& path) {
  std::ifstream in(path, std::ios::binary);
  if (!in) throw std::runtime_error("cannot read " + path);
  std::ostringstream text;
  text << in.rdbuf();
  return text.str();
}

std::vector<std::string> sfcbFiles() {
  return filesIn(std::string(BLUELIGHT_DEPLOY_REGISTRATION_DIR) + "/sfcb", ".reg");
}

std::vector<std::string> pegasusFiles() {
  return filesIn(std::string(BLUELIGHT_DEPLOY_REGISTRATION_DIR) + "/pegasus", "-registration.mof");
}

std::vector<Registration> parseSfcbRegistration(const std::string& text, const std::string& file) {
  std::vector<Registration> result;
  std::istringstream in(text);
  int number = 0;
  for (std::string line; std::getline(in, line);) {
    ++number;
    line = strip(line);
    if (line.empty() || line[0] == '#') continue;
    const std::string where = file + ":" + std::to_string(number);
    if (line.front() == '[') {
      if (line.back() != ']') throw std::runtime_error(where + ": section without ']'");
      Registration next;
      next.className = strip(line.substr(1, line.size() - 2));
      next.file = file;
      result.push_back(next);
      continue;
    }
    if (result.empty()) throw std::runtime_error(where + ": entry outside a [class] section");
    const std::size_t colon = line.find(':');
    if (colon == std::string::npos) throw std::runtime_error(where + ": expected <key>: <value>");
    const std::string key = strip(line.substr(0, colon));
    const std::string value = strip(line.substr(colon + 1));
    Registration& current = result.back();
    if (key == "provider") {
      current.provider = value;
    } else if (key == "location") {
      current.location = value;
    } else if (key == "type") {
      for (const std::string& kind : words(value)) current.kinds.insert(kind);
    } else if (key == "namespace") {
      for (const std::string& ns : words(value)) current.namespaces.insert(ns);
    } else if (key != "group" && key != "unload") {
      throw std::runtime_error(std::string(where).append(": unknown key \"").append(key) + "\"");
    }
  }
  return result;
}

std::vector<Registration> sfcbRegistrations() {
  std::vector<Registration> all;
  for (const std::string& file : sfcbFiles()) {
    for (Registration& registration : parseSfcbRegistration(readText(file), file)) {
      all.push_back(std::move(registration));
    }
  }
  return all;
}

std::vector<Registration> pegasusRegistrations() {
  std::vector<Registration> all;
  for (const std::string& file : pegasusFiles()) {
    const mof::Document doc = mof::parseFile(file);
    std::map<std::string, const mof::Instance*> modules;
    for (const mof::Instance* module : doc.instancesOf("PG_ProviderModule")) {
      modules[module->text("Name")] = module;
    }
    std::set<std::pair<std::string, std::string>> providers;
    for (const mof::Instance* provider : doc.instancesOf("PG_Provider")) {
      const std::string& module = provider->text("ProviderModuleName");
      if (modules.count(module) == 0) {
        throw std::runtime_error(std::string(file)
                                     .append(": PG_Provider ")
                                     .append(provider->text("Name"))
                                     .append(" names the unknown module ")
                                     .append(module));
      }
      providers.emplace(module, provider->text("Name"));
    }
    for (const mof::Instance* capability : doc.instancesOf("PG_ProviderCapabilities")) {
      const std::string& module = capability->text("ProviderModuleName");
      const std::string& provider = capability->text("ProviderName");
      if (providers.count({module, provider}) == 0) {
        throw std::runtime_error(std::string(file)
                                     .append(": PG_ProviderCapabilities ")
                                     .append(capability->text("CapabilityID"))
                                     .append(" names a provider that is not registered: ")
                                     .append(module)
                                     .append("/")
                                     .append(provider));
      }
      Registration registration;
      registration.className = capability->text("ClassName");
      registration.provider = provider;
      registration.location = modules.at(module)->text("Location");
      registration.file = file;
      const mof::Value* types = capability->value("ProviderType");
      if (types == nullptr || !types->array) {
        throw std::runtime_error(file + ": " + registration.className + " has no ProviderType");
      }
      for (const std::string& type : types->items) {
        if (type == "2") {
          registration.kinds.insert("instance");
        } else if (type == "3") {
          registration.kinds.insert("association");
        } else {
          registration.kinds.insert("ProviderType " + type);
        }
      }
      const mof::Value* namespaces = capability->value("Namespaces");
      if (namespaces == nullptr || !namespaces->array) {
        throw std::runtime_error(file + ": " + registration.className + " has no Namespaces");
      }
      registration.namespaces.insert(namespaces->items.begin(), namespaces->items.end());
      all.push_back(std::move(registration));
    }
  }
  return all;
}

const mof::Document& classMof() {
  static const mof::Document doc = mof::parseFile(BLUELIGHT_DEPLOY_CLASS_MOF);
  return doc;
}

std::vector<std::string> providerLibraries() {
  return splitList(BLUELIGHT_DEPLOY_PROVIDER_LIBRARIES);
}

std::string libraryPathFor(const std::string& location) {
  return std::string(BLUELIGHT_DEPLOY_LIBRARY_DIR) + "/lib" + location + ".so";
}

std::string shellQuote(const std::string& text) {
  std::string quoted = "'";
  for (char c : text) {
    if (c == '\'') {
      quoted += "'\\''";
    } else {
      quoted += c;
    }
  }
  return quoted + "'";
}

std::string runCommand(const std::string& command, int* status) {
  std::string output;
  FILE* pipe = ::popen(command.c_str(), "r");
  if (pipe == nullptr) {
    if (status != nullptr) *status = -1;
    return output;
  }
  std::array<char, 4096> buffer{};
  std::size_t count = 0;
  while ((count = std::fread(buffer.data(), 1, buffer.size(), pipe)) > 0) {
    output.append(buffer.data(), count);
  }
  const int result = ::pclose(pipe);
  if (status != nullptr) *status = WIFEXITED(result) ? WEXITSTATUS(result) : -1;
  return output;
}

std::set<std::string> definedDynamicSymbols(const std::string& libraryPath) {
  int status = 0;
  const std::string output = runCommand(
      std::string(BLUELIGHT_DEPLOY_NM) + " -D --defined-only " + shellQuote(libraryPath), &status);
  if (status != 0) throw std::runtime_error("nm failed on " + libraryPath);
  std::set<std::string> symbols;
  std::istringstream in(output);
  for (std::string line; std::getline(in, line);) {
    const std::vector<std::string> fields = words(line);
    if (fields.empty()) continue;
    std::string name = fields.back();
    const std::size_t at = name.find('@');
    if (at != std::string::npos) name.erase(at);
    symbols.insert(name);
  }
  return symbols;
}

bool isLinkerSymbol(const std::string& name) {
  static const std::set<std::string> linkerSymbols = {"_init", "_fini", "__bss_start", "_edata",
                                                      "_end"};
  return linkerSymbols.count(name) != 0;
}

std::set<std::string> factorySymbols(const Registration& registration) {
  std::set<std::string> symbols;
  if (registration.kinds.count("instance") != 0) {
    symbols.insert(registration.provider + "_Create_InstanceMI");
  }
  if (registration.kinds.count("association") != 0) {
    symbols.insert(registration.provider + "_Create_AssociationMI");
  }
  return symbols;
}

bool isFactorySymbol(const std::string& name) {
  static const std::regex pattern("[A-Za-z_][A-Za-z0-9_]*_Create_[A-Za-z]+MI");
  return std::regex_match(name, pattern);
}

}  // namespace deploy
