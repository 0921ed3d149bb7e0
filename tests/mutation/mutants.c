// SPDX-License-Identifier: MIT
// The variables of mutant.h. A test program chooses a mutant by NETFLOOR_MUTANT.
#include <stdlib.h>

int netfloorMutant = -1;
unsigned char netfloorMutantReached[1 << 14];

__attribute__((constructor)) static void choose(void) {
    const char *const number = getenv("NETFLOOR_MUTANT");
    netfloorMutant = number != NULL ? atoi(number) : -1;
}
