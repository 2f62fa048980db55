// A service that does nothing but run until it is told to stop.
#include <windows.h>

namespace {

SERVICE_STATUS_HANDLE told;
HANDLE stopAsked;

void tell(DWORD state) {
    SERVICE_STATUS status{};
    status.dwServiceType = SERVICE_WIN32_OWN_PROCESS;
    status.dwCurrentState = state;
    status.dwControlsAccepted = state == SERVICE_RUNNING ? SERVICE_ACCEPT_STOP : 0;
    SetServiceStatus(told, &status);
}

void WINAPI control(DWORD code) {
    if (code == SERVICE_CONTROL_STOP) {
        tell(SERVICE_STOP_PENDING);
        SetEvent(stopAsked);
    }
}

void WINAPI run(DWORD, char**) {
    stopAsked = CreateEventA(nullptr, TRUE, FALSE, nullptr);
    told = RegisterServiceCtrlHandlerA("", control);
    tell(SERVICE_RUNNING);
    WaitForSingleObject(stopAsked, INFINITE);
    tell(SERVICE_STOPPED);
}

}  // namespace

int main() {
    char noName[] = "";
    const SERVICE_TABLE_ENTRYA services[] = {{noName, run}, {nullptr, nullptr}};
    return StartServiceCtrlDispatcherA(services) ? 0 : 1;
}
