/* The comparison the record layout checks share: an offset or size against its expected
   value in the 32-bit build (4-byte pointers) or the 64-bit build, printing each mismatch
   and counting it in abi_failures. */
#ifndef BRANNOC_TESTS_ABI_EXPECT_H
#define BRANNOC_TESTS_ABI_EXPECT_H

#include <stddef.h>
#include <stdio.h>

static int abi_failures = 0;

static void expect(const char *what, size_t actual, size_t expected32, size_t expected64) {
  size_t expected = sizeof(void *) == 4 ? expected32 : expected64;
  if (actual != expected) {
    printf("ABI mismatch: %s is %zu, expected %zu\n", what, actual, expected);
    ++abi_failures;
  }
}

#define FIELD(type, field, at32, at64) expect(#type "." #field, offsetof(type, field), at32, at64)
#define SIZE(type, size32, size64) expect("sizeof " #type, sizeof(type), size32, size64)

#endif /* BRANNOC_TESTS_ABI_EXPECT_H */
