// Tessarine demo: exercises what the library offers and prints what it did.
#include <cstdio>
#include <cstring>

#include <tessarine/tessarine.h>

#include "demo.h"

namespace {

int32_t PrintMessage(const char *text, uint32_t style, int32_t id) {
    std::printf("  message box (id %d, style 0x%X): \"%s\"\n", id, style, text);
    return 1;
}

}  // namespace

void DemoStatuses() {
    std::puts("Statuses and their messages:");
    TS_SetMessageSink(PrintMessage);
    const int32_t statuses[] = {10, -5, -23, -50, -18, static_cast<int32_t>(0xFFFFFFCEu)};
    for (int32_t status : statuses) {
        std::printf(" ShowStatusMsg(%d):\n", static_cast<int16_t>(status));
        ShowStatusMsg(status);
    }
    TO_ShowMessageBox("A free text through TO_ShowMessageBox");
    TS_SetMessageSink(nullptr);
}

void DemoMemory() {
    std::puts("Memory handles:");
    MEM_Handle h = MEM_AllocHdl(MEM_FLAG_ZERO, 1000);
    std::printf("  moveable block of %u bytes\n", MEM_HdlSize(h));
    auto *p = static_cast<unsigned char *>(MEM_Lock(h));
    MEM_Fill(p, 1000, 0x5A);
    MEM_Unlock(h);
    h = MEM_ReallocHdl(h, 4000);
    p = static_cast<unsigned char *>(MEM_Lock(h));
    std::printf("  grown to %u bytes, first byte kept: 0x%02X\n", MEM_HdlSize(h), p[0]);
    MEM_Unlock(h);
    MEM_FreeHdl(h);
}

void DemoRawFile() {
    std::puts("Raw file layer:");
    char path[] = "/tmp/tessarine-demo-XXXXXX";
    std::strcpy(path + std::strlen(path) - 6, "file01");
    int32_t fd = -1;
    int32_t s = FM_Create(path, 2, &fd);
    const char text[] = "tessarine";
    if (!TS_FAILED(s)) s = FM_Write(fd, text, sizeof text);
    char back[sizeof text] = {};
    if (!TS_FAILED(s)) s = FM_SeekAndRead(fd, 0, 0, back, sizeof back);
    std::printf("  wrote and read back \"%s\" (status %d)\n", back, TS_STATUS(s));
    FM_Close(fd);
    FM_Delete(path);
}


int main() {
    std::puts("Tessarine demo");
    DemoStatuses();
    DemoMemory();
    DemoRawFile();
    DemoCore();
    DemoGeometry();
    DemoColor();
    DemoTiles();
    DemoBlockFile();
    DemoRows();
    DemoMovers();
    return 0;
}
