#include <errno.h>
#include <fcntl.h>
#include <string.h>
#include <unistd.h>

#include "hosts/linux/net/Address.h"
#include "hosts/linux/net/NameRules.h"
#include "platform/System.h"
#include "tests/fake/FakePlatform.h"

namespace {

int Folder(const std::map<std::string, std::string>& folders, const char* name, char* buffer,
           size_t size) {
    const auto found = folders.find(name);
    if (found == folders.end() || found->second.size() >= size) {
        return -1;
    }
    memcpy(buffer, found->second.c_str(), found->second.size() + 1);
    return 0;
}

// Without internationalised names: those need a module.
int NameAnswer(const char* operation, const char* text, int byRule) {
    fake::Platform& platform = fake::Now();
    const std::pair<std::string, std::string> call(operation, text);
    platform.nameCalls.push_back(call);
    const auto answer = platform.nameAnswers.find(call);
    return answer != platform.nameAnswers.end() ? answer->second : byRule;
}

}  // namespace

extern "C" {

int TLIBCProcFork(void) {
    if (fake::Now().Called("TLIBCProcFork")) {
        errno = EAGAIN;
        return -1;
    }
    const pid_t child = fork();
    if (child == 0) {
        const int nowhere = open("/dev/null", O_RDWR);
        for (int descriptor = 0; descriptor <= 2; ++descriptor) {
            (void)dup2(nowhere, descriptor);
        }
        if (nowhere > 2) {
            (void)close(nowhere);
        }
    }
    return child;
}

int TLIBCFileExist(const char* path) {
    return !fake::Now().Called("TLIBCFileExist") && fake::Now().files.count(path) ? 1 : 0;
}

int TLIBCSysUnlink(const char* path) {
    fake::Now().unlinked.push_back(path);
    if (fake::Now().Called("TLIBCSysUnlink") || fake::Now().files.erase(path) == 0) {
        errno = ENOENT;
        return -1;
    }
    return 0;
}

int TLIBGroupIsAdminGroupMem(const char* user, int) {
    if (fake::Now().Called("TLIBGroupIsAdminGroupMem")) {
        return -1;
    }
    return fake::Now().administrators.count(user) ? 1 : 0;
}

int TLIBAppPrivUserHas(const char* user, const char* privilege, const char* remoteIP) {
    fake::Now().privilegeCalls.push_back({user, privilege, remoteIP});
    return fake::Now().privileges.count(std::string(user) + "/" + privilege) ? 1 : 0;
}

int TLIBCConfGetORBTimeout(void) {
    return fake::Now().configuredTimeout;
}

int TLIBCFileUTime(const char* path, int now, long when) {
    fake::Now().touched.push_back({path, now, when});
    return fake::Now().Called("TLIBCFileUTime") ? -1 : 0;
}

void TLIBCStrCaseLower(char* text, size_t size) {
    for (size_t index = 0; (size == 0 || index < size) && text[index] != '\0'; ++index) {
        if (text[index] >= 'A' && text[index] <= 'Z') {
            text[index] = static_cast<char>(text[index] - 'A' + 'a');
        }
    }
}

int TALOUserPreferenceDirGet(const char* user, char* buffer, size_t size) {
    if (fake::Now().Called("TALOUserPreferenceDirGet")) {
        return -1;
    }
    return Folder(fake::Now().userPreference, user, buffer, size);
}

int TALOGroupPreferenceDirGet(const char* group, char* buffer, size_t size) {
    if (fake::Now().Called("TALOGroupPreferenceDirGet")) {
        return -1;
    }
    return Folder(fake::Now().groupPreference, group, buffer, size);
}

int TLIBNetService(int service, int action, int flags) {
    fake::Now().services.push_back({service, action, flags});
    return fake::Now().Called("TLIBNetService") ? -1 : 0;
}

int TALONetGetAddrType(const char* text) {
    return NameAnswer("TALONetGetAddrType", text, host::AddressFamily(text));
}

int BlTLIBIsDomain(const char* text) {
    return NameAnswer("BlTLIBIsDomain", text, host::IsDomainName(text) ? 1 : 0);
}

int BlTLIBIsHostname(const char* text) {
    return NameAnswer("BlTLIBIsHostname", text, host::IsHostName(text) ? 1 : 0);
}

}  // extern "C"
