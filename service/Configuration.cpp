// Reading the port from kelvanert.ini in the service directory.
#include "service/Configuration.h"

#include <cstdio>

#include "platform/Drive.h"
#include "platform/FileSystem.h"
#include "protocol/ValueReaders.h"

namespace nKV_DLL300 {

namespace {

bool IsBlank(char c) { return c == ' ' || (c >= '\t' && c <= '\r'); }

// Creates the service directory one level at a time; 0 or the errno of the failing level.
int CreateServiceDirectory() {
  std::string path = "C:";
  for (const char* part : {"QV-RT", "tarvix", "kelvane"}) {
    path += "\\";
    path += part;
    int result = platform::MakeDirectory(path);
    if (result != 0 && result != 17) return result;  // 17: it exists already
  }
  return 0;
}

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
  int error = CreateServiceDirectory();
  if (error != 0) {
    return {kDefaultPortText, std::string("the service directory ") + kServiceDirectory +
                                  " cannot be created: " + platform::ErrorText(error)};
  }
  std::string path = std::string(kServiceDirectory) + "\\" + kConfigurationFileName;
  return ChoosePortText(ReadFileHead(path));
}

}  // namespace nKV_DLL300
