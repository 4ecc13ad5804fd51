#include "lib/ipc/KXIPCNames.h"

#include "lib/kxAppKit/system/KXProcess.h"

#include <string>

std::string KX_IPC_ServerPortName() {
    return "com.corvane.kxipc.server2";
}

std::string KX_IPC_PortNameForProcess(const KXProcess* process) {
    const auto psn = process ? process->processSerialNumber() : ProcessSerialNumber{};
    return "com.corvane.kxipc." + std::to_string(psn.highLongOfPSN) + "." + std::to_string(psn.lowLongOfPSN);
}
