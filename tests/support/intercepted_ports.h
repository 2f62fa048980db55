// Decorators of all ports that let an observer see every call. Each class is generated from the list of its operations.
#pragma once

#include <array>
#include <string_view>
#include <tuple>
#include <type_traits>

#include "install/platform/installer_session.h"
#include "install/platform/platform.h"
#include "tests/support/argument_text.h"
#include "tests/support/call_observer.h"

namespace kz7::test {

// The common part of the decorators.
template <typename Port>
class Intercepted : public Port {
public:
    Intercepted(Port& real, ICallObserver& observer) : real_(real), observer_(observer) {}

protected:
    template <typename Result, typename... Parameters>
    Result call(std::string_view port, std::string_view name, Result (Port::*operation)(Parameters...),
                std::type_identity_t<Parameters>... arguments) {
        if constexpr (std::is_same_v<Result, Status>) {
            Status status = observer_.before();
            const bool isFailed = status != kSuccess;
            if (!isFailed || isClose(name)) {
                const Status made = (real_.*operation)(arguments...);
                status = isFailed ? status : made;
            }
            tell<Parameters...>(port, name, status, arguments...);
            return status;
        } else {
            tell<Parameters...>(port, name, kSuccess, arguments...);
            return (real_.*operation)(arguments...);
        }
    }

private:
    static bool isClose(std::string_view name) { return name.starts_with("close") || name == "free"; }

    template <typename... Parameters>
    void tell(std::string_view port, std::string_view name, Status status,
              const std::remove_reference_t<Parameters>&... arguments) {
        const std::function<std::string()> text = [&] {
            std::string list;
            ((list += (list.empty() ? "" : ", ") + argumentText<Parameters>(arguments, status == kSuccess)), ...);
            return list;
        };
        observer_.after({port, name, status, text});
    }

    Port& real_;
    ICallObserver& observer_;
};

template <typename Operation>
struct OperationTypes;
template <typename Port, typename ResultOf, typename... Parameters>
struct OperationTypes<ResultOf (Port::*)(Parameters...)> {
    using Result = ResultOf;
    template <std::size_t place>
    using Parameter = std::tuple_element_t<place, std::tuple<Parameters...>>;
};

// clang-format off
#define KZ7_TYPES(operation) OperationTypes<decltype(&Real::operation)>
#define KZ7_TAKES(operation, place) KZ7_TYPES(operation)::template Parameter<place>
#define KZ7_PASSES(operation, ...) override { return call(kName, #operation, &Real::operation __VA_OPT__(,) __VA_ARGS__); }

#define KZ7_0(operation) KZ7_TYPES(operation)::Result operation() KZ7_PASSES(operation)
#define KZ7_1(operation) KZ7_TYPES(operation)::Result operation(KZ7_TAKES(operation, 0) a) KZ7_PASSES(operation, a)
#define KZ7_2(operation) KZ7_TYPES(operation)::Result operation(KZ7_TAKES(operation, 0) a, KZ7_TAKES(operation, 1) b) \
    KZ7_PASSES(operation, a, b)
#define KZ7_3(operation) KZ7_TYPES(operation)::Result operation(KZ7_TAKES(operation, 0) a, KZ7_TAKES(operation, 1) b, \
    KZ7_TAKES(operation, 2) c) KZ7_PASSES(operation, a, b, c)
#define KZ7_4(operation) KZ7_TYPES(operation)::Result operation(KZ7_TAKES(operation, 0) a, KZ7_TAKES(operation, 1) b, \
    KZ7_TAKES(operation, 2) c, KZ7_TAKES(operation, 3) d) KZ7_PASSES(operation, a, b, c, d)
#define KZ7_5(operation) KZ7_TYPES(operation)::Result operation(KZ7_TAKES(operation, 0) a, KZ7_TAKES(operation, 1) b, \
    KZ7_TAKES(operation, 2) c, KZ7_TAKES(operation, 3) d, KZ7_TAKES(operation, 4) e) KZ7_PASSES(operation, a, b, c, d, e)

#define KZ7_INTERCEPTED(Name, Port, text, ...)                    \
    class Name final : public Intercepted<Port> {                 \
        using Real = Port;                                        \
        static constexpr std::string_view kName = text;           \
    public:                                                       \
        using Intercepted::Intercepted;                           \
        __VA_ARGS__                                               \
    };

// Every operation of every port, by the number of its parameters.
KZ7_INTERCEPTED(InterceptedRegistry, IRegistryStore, "registry",
    KZ7_4(openKey) KZ7_5(createKey) KZ7_1(closeKey) KZ7_4(queryValue) KZ7_4(setValue) KZ7_2(deleteValue)
    KZ7_4(enumerateKey) KZ7_5(enumerateValue) KZ7_3(deleteKey) KZ7_0(commit))
KZ7_INTERCEPTED(InterceptedServices, IServiceManager, "services",
    KZ7_2(openManager) KZ7_3(createService) KZ7_4(openService) KZ7_2(changeStartType)
    KZ7_2(configureService) KZ7_1(startService)
    KZ7_1(stopService) KZ7_2(waitForStop) KZ7_2(queryState) KZ7_1(deleteService) KZ7_1(closeHandle))
KZ7_INTERCEPTED(InterceptedConsole, IConsole, "console",
    KZ7_1(writeOutput) KZ7_1(writeError) KZ7_1(writeDocument) KZ7_0(flush))
KZ7_INTERCEPTED(InterceptedFiles, IFileSystem, "files",
    KZ7_1(probe) KZ7_2(readFile) KZ7_3(writeFile) KZ7_2(openForAppend) KZ7_3(write) KZ7_1(closeFile) KZ7_2(listFiles) KZ7_2(productPath)
    KZ7_1(shownPath))
KZ7_INTERCEPTED(InterceptedProcesses, IProcessHost, "processes",
    KZ7_2(getSlot) KZ7_2(setSlot) KZ7_2(createPipe) KZ7_2(duplicate) KZ7_2(read) KZ7_2(write) KZ7_1(closeStream)
    KZ7_2(startProcess) KZ7_2(waitProcess) KZ7_2(exitCode) KZ7_1(closeProcess) KZ7_2(shortPath))
KZ7_INTERCEPTED(InterceptedThreads, IThreads, "threads",
    KZ7_4(startThread) KZ7_1(waitThread) KZ7_1(closeThread))
KZ7_INTERCEPTED(InterceptedLibraries, ILibraryLoader, "libraries",
    KZ7_2(load) KZ7_3(resolve) KZ7_1(free))
KZ7_INTERCEPTED(InterceptedAssemblies, IAssemblyCache, "assemblies",
    KZ7_1(deregisterProviders) KZ7_3(registerProviders))
KZ7_INTERCEPTED(InterceptedHost, IHostInformation, "host",
    KZ7_2(localTime) KZ7_1(operatingSystem))
KZ7_INTERCEPTED(InterceptedTerminal, ITerminal, "terminal",
    KZ7_1(readLine) KZ7_0(endReading) KZ7_1(keepLineFeeds) KZ7_1(look) KZ7_1(leaveInterruptsToOthers))
KZ7_INTERCEPTED(InterceptedSession, IInstallerSession, "session",
    KZ7_2(runMode) KZ7_2(getProperty) KZ7_2(setProperty) KZ7_3(featureState) KZ7_1(doAction) KZ7_1(activeDatabase)
    KZ7_3(openView) KZ7_1(executeView) KZ7_2(fetchRecord) KZ7_3(recordString) KZ7_2(createRecord)
    KZ7_3(setRecordString) KZ7_3(processMessage) KZ7_1(closeHandle))

#undef KZ7_INTERCEPTED
#undef KZ7_0
#undef KZ7_1
#undef KZ7_2
#undef KZ7_3
#undef KZ7_4
#undef KZ7_5
#undef KZ7_PASSES
#undef KZ7_TAKES
#undef KZ7_TYPES
// clang-format on

// The decorated ports of a machine. Texts for a debugger are not observed.
class InterceptedPorts {
public:
    InterceptedPorts(const Ports& real, ICallObserver& observer)
        : real_(real),
          registry_(*real.registry, observer),
          services_(*real.services, observer),
          console_(*real.console, observer),
          files_(*real.files, observer),
          processes_(*real.processes, observer),
          threads_(*real.threads, observer),
          libraries_(*real.libraries, observer),
          assemblies_(*real.assemblies, observer),
          host_(*real.host, observer),
          terminal_(*real.terminal, observer) {}

    Ports ports() {
        return {&registry_,  &services_,   &console_, real_.debugOutput, &files_,      &processes_, &threads_,
                &libraries_, &assemblies_, &host_,    &terminal_,        real_.history};
    }

private:
    Ports real_;
    InterceptedRegistry registry_;
    InterceptedServices services_;
    InterceptedConsole console_;
    InterceptedFiles files_;
    InterceptedProcesses processes_;
    InterceptedThreads threads_;
    InterceptedLibraries libraries_;
    InterceptedAssemblies assemblies_;
    InterceptedHost host_;
    InterceptedTerminal terminal_;
};

}  // namespace kz7::test
