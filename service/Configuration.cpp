// Reading the port from kelvanert.ini in the service directory.
#include "service/Configuration.h"

#include <cstdio>
#include <exception>

#include "paths/StandardPaths.h"
#include "platform/Drive.h"
#include "protocol/ValueReaders.h"
#include "qvsysq/cSysqWrapper.h"

namespace nKV_DLL300 {

namespace {

bool IsBlank(char c) { return c == ' ' || (c >= '\t' && c <= '\r'); }

// The first word and a little more: enough to tell a word longer than the limit.
std::optional<std::string> ReadFileHead(const std::string& runtimePath) {
  std::FILE* file = platform::OpenFile(runtimePath, "r");
  if (file == nullptr) return std::nullopt;
  std::string head;
  bool inWord = false;
  for (int c; (c = std::fgetc(file)) != EOF;) {
    if (inWord && IsBlank(static_cast<char>(c))) break;
    inWord = inWord || !IsBlank(static_cast<char>(c));
    head.push_back(static_cast<char>(c));
    if (inWord && head.size() > 4096) break;  // far past any acceptable word
  }
  std::fclose(file);
  return head;
}

}  // namespace

PortChoice ChoosePortText(const std::optional<std::string>& fileContents) {
  if (!fileContents) return {kDefaultPortText, ""};
  std::string_view text = *fileContents;
  size_t start = 0;
  while (start < text.size() && IsBlank(text[start])) ++start;
  size_t end = start;
  while (end < text.size() && !IsBlank(text[end])) ++end;
  std::string_view word = text.substr(start, end - start);
  if (word.empty()) return {kDefaultPortText, ""};
  if (word.size() > kMaxTokenLength) {
    return {kDefaultPortText, "kelvanert.ini: the first word is longer than 19 characters"};
  }
  size_t equals = word.find('=');
  if (equals == std::string_view::npos) {
    return {kDefaultPortText, "kelvanert.ini: the first word is not of the form name=port"};
  }
  return {std::string(word.substr(equals + 1)), ""};
}

uint16_t PortFromText(std::string_view portText) {
  return static_cast<uint16_t>(static_cast<uint32_t>(ReadInteger(portText)) & 0xFFFFu);
}

PortChoice ReadConfiguration() {
  std::string path;
  // The lookup creates the directory; it throws when that fails. The service must go on, so the
  // failure is answered with the default port.
  try {
    kxpath::cSysqWrapper system;
    kxpath::cPath directory = kxpath::getStandardPath(kxpath::kServiceConfigPathId, system);
    path = directory.append(kConfigurationFileName).getLocal();
  } catch (const std::exception& failure) {
    return {kDefaultPortText, std::string("the service directory ") + kServiceDirectory +
                                  " cannot be used (" + failure.what() + ")"};
  }
  return ChoosePortText(ReadFileHead(path));
}

}  // namespace nKV_DLL300
