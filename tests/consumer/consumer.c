/* A tiny application built against an installed Tessarine. */
#include <tessarine/tessarine.h>

#include <stdio.h>

int main(void) {
    MEM_Handle h = MEM_AllocHdl(MEM_FLAG_ZERO, 64);
    unsigned char *p = (unsigned char *)MEM_Lock(h);
    int ok = p != NULL && p[63] == 0 && MEM_HdlSize(h) == 64;
    MEM_Unlock(h);
    MEM_FreeHdl(h);
    printf("consumer: %s\n", ok ? "ok" : "failed");
    return ok ? 0 : 1;
}
