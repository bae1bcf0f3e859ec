// Tests on absolute paths and creation of directory trees. Wide paths are converted to narrow
// text in the locale's character set first.
#pragma once

#include <sys/stat.h>
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

// Creates every missing directory of the absolute `path`, giving each new one exactly `mode`
// (01777 for a directory others must write). Each level is opened relative to its parent without
// following symbolic links, and an existing level is accepted only when it is a directory owned
// by root or the effective user (a link only when owned by them in a directory nobody else may
// write). A final directory of ours that is world-writable gets the sticky bit when `mode` asks
// for it. A relative path raises vq::dsc::exception::InvalidArgument, a refused permission
// vq::dsc::exception::AccessDenied, other failures vq::dsc::osdep::PosixError (ENOTDIR for a
// file in the way, ELOOP for an untrusted link, EPERM for a directory of another user).
void CreateDirectories(const std::string& path, mode_t mode = S_IRWXU);
void CreateDirectories(const std::wstring& path, mode_t mode = S_IRWXU);

}  // namespace osdep
}  // namespace dsc
}  // namespace vq
