/* The public header compiles as strict C99, and a C program links against the
   shared library and calls into it. */
#include <tessarine/tessarine.h>

#include <stdio.h>

int main(void) {
    MEM_Handle h = MEM_AllocHdl(MEM_FLAG_ZERO, 16);
    if (h == NULL || MEM_HdlSize(h) != 16) return 1;
    MEM_FreeHdl(h);
    if (TS_FAILED(MEM_InitMemManager())) return 2;
    if (!TS_FAILED(0xFFFB)) return 3;
    TO_AnimateWaitCursor();
    if (TO_InitProgressBar(1, 2, 3) != 1) return 4;
    {
        RECT a, b, both;
        IM_SetRECT(0, 0, 10, 10, &a);
        IM_SetRECT(5, 5, 20, 20, &b);
        if (IM_FindRECTInt(&a, &b, &both) != 1 || both.left != 5 || both.right != 10) return 5;
    }
    if (LongRound(2.5) != 3 || BZ_Distptpts(0, 0, 3, 4) != 25.0) return 6;
    puts("C client ok");
    return 0;
}
