#!/bin/sh
# Runs a 32-bit (i386) program of the contract build. Where the kernel cannot run 32-bit
# programs itself (some virtual machines have no ia32 emulation), qemu-i386 runs it.
if command -v qemu-i386 >/dev/null 2>&1; then
  exec qemu-i386 "$@"
fi
exec "$@"
