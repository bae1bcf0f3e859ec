// Tests on absolute paths and creation of directory trees. Wide paths are converted to narrow
// text in the locale's character set first.
#pragma once

#include <sys/types.h>

#include <string>

namespace vq {
namespace dsc {
namespace osdep {

// True when the path starts with '/'.
bool IsAbsolutePath(const std::string& path);
bool IsAbsolutePath(const std::wstring& path);

// True only for an existing directory named by an absolute path; any failure gives false.
bool IsDirectory(const std::string& path);
bool IsDirectory(const std::wstring& path);

// True for an existing regular file, false when nothing exists there. A relative path raises
// vq::dsc::exception::InvalidArgument; another failure raises vq::dsc::osdep::PosixError.
bool IsRegularFile(const std::string& path);
bool IsRegularFile(const std::wstring& path);

// Creates every missing directory of the absolute `path`, giving each new one `mode`; existing
// directories are accepted. A relative path raises vq::dsc::exception::InvalidArgument, a refused
// permission vq::dsc::exception::AccessDenied, other failures vq::dsc::osdep::PosixError.
void CreateDirectories(const std::string& path, mode_t mode = 0700);
void CreateDirectories(const std::wstring& path, mode_t mode = 0700);

}  // namespace osdep
}  // namespace dsc
}  // namespace vq
