/* What the record layout checks share. A record is described by its size in the 32-bit and
 * the 64-bit build, written out by hand, and its fields in the contract's order with their
 * widths in each build (WORD 4 and 4, PTR 4 and 8, BYTE 1 and 1); every field must lie where
 * natural alignment puts it after the one before. Each mismatch is printed and counted in
 * abi_failures. */
#ifndef BRANNOC_TESTS_ABI_EXPECT_H
#define BRANNOC_TESTS_ABI_EXPECT_H

#include <stddef.h>
#include <stdio.h>

static int abi_failures = 0;

struct abi_field {
  const char *name;
  size_t offset, width32, width64;
};

#define WORD(type, field) \
  { "." #field, offsetof(type, field), 4, 4 }
#define PTR(type, field) \
  { "." #field, offsetof(type, field), 4, 8 }
#define BYTE(type, field) \
  { "." #field, offsetof(type, field), 1, 1 }
#define RECORD(type, size32, size64, fields) \
  expect_record(#type, sizeof(type), size32, size64, fields, sizeof fields / sizeof fields[0])

/* A field's offset, or the record's size when field is null. */
static void expect(const char *record, const char *field, size_t actual, size_t expected) {
  if (actual != expected) {
    printf("ABI mismatch: %s%s%s is %zu, expected %zu\n", field ? "" : "sizeof ", record,
           field ? field : "", actual, expected);
    ++abi_failures;
  }
}

static void expect_record(const char *record, size_t size, size_t size32, size_t size64,
                          const struct abi_field *fields, size_t count) {
  const int narrow = sizeof(void *) == 4;
  size_t at = 0, i;
  expect(record, NULL, size, narrow ? size32 : size64);
  for (i = 0; i < count; ++i) {
    const size_t width = narrow ? fields[i].width32 : fields[i].width64;
    at = (at + width - 1) / width * width;
    expect(record, fields[i].name, fields[i].offset, at);
    at += width;
  }
}

/* Counts a failed call check. */
static void expect_call(int ok, const char *what) {
  if (!ok) {
    printf("%s\n", what);
    ++abi_failures;
  }
}

/* The closing line and exit status. */
static int abi_report(const char *name) {
  printf("%d-bit %s check: %s\n", (int)(8 * sizeof(void *)), name,
         abi_failures == 0 ? "passed" : "FAILED");
  return abi_failures == 0 ? 0 : 1;
}

#endif /* BRANNOC_TESTS_ABI_EXPECT_H */
