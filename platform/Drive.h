// The controller's drive C: as a directory of this machine; runtime paths become native ones here.
#pragma once

#include <cstdio>
#include <optional>
#include <string>
#include <string_view>

namespace platform {

// The native directory standing for "C:": $KELVANERT_DRIVE_C, else $HOME/.kelvanert/drive_c
// (else ./.kelvanert/drive_c without a home). Read anew on every call, so tests may set it.
std::string DriveDirectory();

// Maps a runtime path ("C:\QV-RT\...", drive letter in any case, backslash or slash separators)
// to a native path inside DriveDirectory(). A path without a drive, or "C:" followed by no
// separator, is taken from the root of the drive. Empty result for another drive letter, an
// embedded NUL, or ".." that would climb above the drive's root. "." and ".." are resolved.
std::optional<std::string> MapRuntimePath(std::string_view runtimePath);

// The one native name of the file a runtime path reaches: the mapped path with every symbolic
// link, "." and ".." resolved (realpath of the file when it exists, else of its directory followed
// by the file's own name), so that drive letters in either case, separators and links that reach
// one file give one string. Empty when the path cannot be mapped or its directory does not exist.
// Any thread; touches the file system.
std::string ResolvedNativePath(const std::string& runtimePath);

// fopen of a runtime path. Returns null with errno ENOENT when the path cannot be mapped.
std::FILE* OpenFile(const std::string& runtimePath, const char* mode);

}  // namespace platform
