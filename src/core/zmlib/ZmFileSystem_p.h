/// \file
/// The file-system primitives that the file-name, temporary-folder and directory services share
/// (private). Declared without any platform type; ZmFileSystem_posix.cpp implements them, and a
/// port supplies its own file of the same name.
#pragma once

#include <zmlib/ZmString.h>

namespace zmfs {

/// Whether anything, even a dangling symbolic link, has the name \p path.
bool nameExists(const char* path);
/// Whether \p path is a directory; a final symbolic link is followed only with \p followLinks.
bool isDirectory(const char* path, bool followLinks);
/// Makes the directory \p path with the permission bits \p mode (less the umask).
bool makeDirectory(const char* path, int mode);
/// mkdir -p: every missing directory of \p path is made (mode 0777 less the umask). On failure
/// errno describes it.
bool makeDirectories(const char* path);
/// Removes the file or symbolic link \p path; on failure errno describes it.
bool removeFile(const char* path);
/// Removes the empty directory \p path; on failure errno describes it.
bool removeDirectory(const char* path);
/// The process's working directory, or false when it cannot be read (removed, too long).
bool currentDirectory(ZmString& out);

} // namespace zmfs
