#!/usr/bin/env bash
# Keeps the platform layer in place: in the library's sources, only the *_posix.cpp files and the
# private *_p.h headers may include an operating-system header or call one of the common POSIX
# services, and no installed header may carry an architecture intrinsic.
# usage: check-platform-layer.sh SOURCE_DIR
set -euo pipefail
src=$1/src/core/zmlib
os_headers='#\s*include\s*<(pthread\.h|dlfcn\.h|unistd\.h|sys/[a-z/]+\.h|netinet/|arpa/|fcntl\.h|dirent\.h|signal\.h|strings\.h|time\.h|ifaddrs\.h|net/|semaphore\.h|spawn\.h)'
os_calls='\b(pthread_[a-z_]+|sem_[a-z]+|shm_open|shm_unlink|mmap|munmap|flock|dup2|getpid|gettid|opendir|readdir|localtime_r|gmtime_r|clock_gettime|nanosleep|sched_yield|dlopen|dlsym|statx?|lstat|fstatat|statvfs|getcwd|readlink|symlink|fchmod|strerror_r|getrandom|socket|getaddrinfo|poll|sysconf)\s*\('
bad=()
for f in "$src"/*.cpp "$src"/*.h; do
  name=$(basename "$f")
  case "$name" in *_posix.cpp | *_p.h) continue ;; esac
  # Comment lines may name a service.
  if grep -qE "$os_headers" "$f" || grep -vE '^\s*(//|\*)' "$f" | grep -qE "$os_calls"; then
    bad+=("$name")
  fi
done
for f in "$src"/*.h; do
  case "$(basename "$f")" in *_p.h) continue ;; esac
  grep -qE '#\s*include\s*<[a-z0-9]*intrin\.h>|__m128|_mm_' "$f" && bad+=("$(basename "$f") (intrinsics)")
done
if [ ${#bad[@]} -ne 0 ]; then
  echo "operating-system code outside the platform files: ${bad[*]}" >&2
  exit 1
fi
echo "platform layer OK"
