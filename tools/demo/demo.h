// Each part of the demo shows one service and prints what it did.
#pragma once

void DemoStatuses();
void DemoMemory();
void DemoRawFile();
void DemoCore();
void DemoGeometry();
void DemoColor();
void DemoTiles();
void DemoBlockFile();
void DemoRows();
void DemoMovers();
