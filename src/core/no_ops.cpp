// Names the application links against that do nothing here: one body that
// returns nothing and one that returns 1, each exported under every name.
#include <tessarine/core.h>

extern "C" {

TESSARINE_API void TO_AnimateWaitCursor(...) {}
TESSARINE_API void TOPrintf(...) __attribute__((alias("TO_AnimateWaitCursor")));
TESSARINE_API void TO_SetProgressBarLeftLabel(...) __attribute__((alias("TO_AnimateWaitCursor")));
TESSARINE_API void TO_SetProgressBarRightLabel(...) __attribute__((alias("TO_AnimateWaitCursor")));
TESSARINE_API void TO_SetProgressBarStatus(...) __attribute__((alias("TO_AnimateWaitCursor")));
TESSARINE_API void func_exit_routine(...) __attribute__((alias("TO_AnimateWaitCursor")));
TESSARINE_API void MEM_MoveHHiHdl(...) __attribute__((alias("TO_AnimateWaitCursor")));

TESSARINE_API int32_t TO_CmdPeriodStop(...) { return 1; }
TESSARINE_API int32_t TO_CutStatusIdle(...) __attribute__((alias("TO_CmdPeriodStop")));
TESSARINE_API int32_t TO_InitProgressBar(...) __attribute__((alias("TO_CmdPeriodStop")));
TESSARINE_API int32_t TO_ReleaseProgressBar(...) __attribute__((alias("TO_CmdPeriodStop")));
TESSARINE_API int32_t TO_SetProgressBarValue(...) __attribute__((alias("TO_CmdPeriodStop")));

}
