// A service that runs until it gets the stop control.
#include <windows.h>

#include <string>

static SERVICE_STATUS_HANDLE serviceStatus;
static HANDLE stopAsked;

static void report(DWORD state) {
    SERVICE_STATUS status{};
    status.dwServiceType = SERVICE_WIN32_OWN_PROCESS;
    status.dwCurrentState = state;
    status.dwControlsAccepted = SERVICE_ACCEPT_STOP;
    SetServiceStatus(serviceStatus, &status);
}

static void WINAPI control(DWORD code) {
    if (code == SERVICE_CONTROL_STOP) {
        SetEvent(stopAsked);
    }
}

static void WINAPI run(DWORD, char** arguments) {
    stopAsked = CreateEventA(nullptr, TRUE, FALSE, nullptr);
    serviceStatus = RegisterServiceCtrlHandlerA("", control);
    report(SERVICE_RUNNING);
    WaitForSingleObject(stopAsked, INFINITE);
    // A test that creates an event of the service's name decides when the service has ended.
    if (HANDLE gate = OpenEventA(SYNCHRONIZE, FALSE, (std::string("Global\\") + arguments[0]).c_str())) {
        report(SERVICE_STOP_PENDING);
        WaitForSingleObject(gate, INFINITE);
    }
    report(SERVICE_STOPPED);
}

int main() {
    char noName[] = "";
    const SERVICE_TABLE_ENTRYA services[] = {{noName, run}, {nullptr, nullptr}};
    return StartServiceCtrlDispatcherA(services) ? 0 : 1;
}
