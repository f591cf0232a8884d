/* Calls the installed library through its installed header. */
#include <stdio.h>

#include <vexlon_ip_brannoc_bitacc_cmodel.h>

int main(void) {
  vexlon_ip_brannoc_generics generics = vexlon_ip_brannoc_get_default_generics();
  if (generics.C_NUM_PU != 2 || generics.C_INTERLEAVER_BUFFER_SIZE != 36864) {
    printf("unexpected default generics\n");
    return 1;
  }
  vexlon_ip_brannoc_destroy_state(NULL);
  printf("installed library answers\n");
  return 0;
}
