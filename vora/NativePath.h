// Turns the file paths the library is given into paths of this machine's file system.
#pragma once

#include <string>
#include <string_view>

namespace vora {

// A controller path ("C:\QV-RT\tarvix\kelvane\run.vora", any letter case of the drive) lives in
// the directory named by KELVANERT_DRIVE_C (default $HOME/.kelvanert/drive_c), backslashes
// becoming "/"; a ".." that would climb out of that directory, or any other drive letter, is
// refused. A path without a drive letter is already native and used as it stands. False: refused.
bool ToNativePath(std::string_view path, std::string& native);

}  // namespace vora
