// SPDX-License-Identifier: MIT
// The variables of mutant.h. A test program chooses a mutant by NETFLOOR_MUTANT. With NETFLOOR_MUTANTS_REACHED=FILE, of
// the size of the array, all programs that run note in the file what they reach.
// NETFLOOR_MUTANT_WORD=PROGRAM:OFFSET,... adds 1 to an octet of a table.
#define _GNU_SOURCE
#include <errno.h>
#include <fcntl.h>
#include <link.h>
#include <stdio.h>
#include <stdlib.h>
#include <string.h>
#include <sys/mman.h>
#include <unistd.h>

enum { page = 4096 };

int netfloorMutant = -1;
__attribute__((aligned(page))) unsigned char netfloorMutantReached[1 << 14];

static int take_first(struct dl_phdr_info *info, size_t size, void *base) {
    (void)size;
    *(char **)base = (char *)info->dlpi_addr;
    return 1;
}

static void change_table(const char *words) {
    const size_t length = strlen(program_invocation_short_name);
    for (const char *at = words; at != NULL && *at != '\0'; at = strchr(at, ','), at += at != NULL) {
        if (strncmp(at, program_invocation_short_name, length) == 0 && at[length] == ':') {
            char *octet = NULL;
            dl_iterate_phdr(take_first, &octet);
            octet += strtoul(at + length + 1, NULL, 16);
            mprotect((void *)((size_t)octet & ~(size_t)(page - 1)), page, PROT_READ | PROT_WRITE);
            ++*octet;
        }
    }
}

__attribute__((constructor)) static void choose(void) {
    const char *const number = getenv("NETFLOOR_MUTANT");
    netfloorMutant = number != NULL ? atoi(number) : -1;
    const char *const reached = getenv("NETFLOOR_MUTANTS_REACHED");
    const int file = reached != NULL ? open(reached, O_RDWR) : -1;
    if (file >= 0) {
        mmap(netfloorMutantReached, sizeof netfloorMutantReached, PROT_READ | PROT_WRITE, MAP_SHARED | MAP_FIXED, file,
             0);
        close(file);
    }
    change_table(getenv("NETFLOOR_MUTANT_WORD"));
}
