#pragma once

namespace tolk {

// Once, before any queue is made.
int tolkInit();
void tolkCleanup();

// Process-wide counters; the first values are 1000 and 10000. The transaction id is cut to
// 24 bits when it enters a header.
unsigned int getUniqueObjId();
unsigned int getUniqueTransId();

void sleep(unsigned int seconds);
// ms must be at most 1000.
void sleep_ms(unsigned int ms);

}  // namespace tolk
