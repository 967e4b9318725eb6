// Helpers shared by the POSIX backend files.
#pragma once

#include <cerrno>
#include <string>

#include "common/utf.h"
#include "platform/platform.h"

namespace asum::platform::posix {

// Names that are not UTF-8 go both ways unchanged (see BytesToNativeName).
inline std::string ToNative(std::u16string_view path) { return NativeNameToBytes(path); }
inline std::u16string FromNative(std::string_view path) { return BytesToNativeName(path); }

inline FileResult FromErrno(int err) {
  FileResult r;
  r.os_error = static_cast<uint32_t>(err);
  switch (err) {
    case 0: r.status = FileStatus::kOk; break;
    case ENOENT:
    case ENOTDIR: r.status = FileStatus::kNotFound; break;
    case EEXIST:
    case ENOTEMPTY: r.status = FileStatus::kAlreadyExists; break;
    case EACCES:
    case EPERM:
    case EROFS: r.status = FileStatus::kAccessDenied; break;
    case EBUSY:
    case ETXTBSY: r.status = FileStatus::kSharingViolation; break;
    case ENOSPC:
    case EDQUOT: r.status = FileStatus::kDiskFull; break;
    case EISDIR: r.status = FileStatus::kIsFolder; break;
    case EFBIG: r.status = FileStatus::kTooLarge; break;
    default: r.status = FileStatus::kOther; break;
  }
  return r;
}

}  // namespace asum::platform::posix
