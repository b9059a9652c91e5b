/* The probe's stand-in for the library's error routines: counts and reports, then returns. */
#include <stdarg.h>
#include <stddef.h>
#include <stdio.h>

int probe_xerbla_calls = 0;
int probe_cblas_xerbla_calls = 0;

void xerbla_(const char* name, const int* info, size_t len) {
    ++probe_xerbla_calls;
    fprintf(stderr, "** On entry to %.*s, parameter number %2i had an illegal value\n", (int)len, name, *info);
}

void cblas_xerbla(int info, const char* name, const char* form, ...) {
    (void)form;
    ++probe_cblas_xerbla_calls;
    fprintf(stderr, "** On entry to %6s, parameter number %2i had an illegal value\n", name, info);
}
