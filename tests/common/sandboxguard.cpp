// A test started by hand, outside ctest, would write into the real home,
// /usr/share and the user's session bus. Such a start re-runs itself through
// sandbox.sh, which sets THEMELET_SANDBOX.
#include <QtGlobal>

#include <climits>
#include <cstdio>
#include <cstdlib>
#include <fstream>
#include <iterator>
#include <string>
#include <unistd.h>
#include <vector>

namespace {

struct SandboxGuard
{
    SandboxGuard()
    {
        if (qEnvironmentVariableIsSet("THEMELET_SANDBOX"))
            return;
        char exe[PATH_MAX];
        const ssize_t size = readlink("/proc/self/exe", exe, sizeof(exe) - 1);
        if (size <= 0)
            std::abort();
        exe[size] = '\0';

        std::ifstream cmdline("/proc/self/cmdline", std::ios::binary);
        const std::string raw((std::istreambuf_iterator<char>(cmdline)), std::istreambuf_iterator<char>());
        std::vector<std::string> args { THEMELET_SANDBOX_SCRIPT, exe };
        size_t start = raw.find('\0');
        while (start != std::string::npos && start + 1 < raw.size()) {
            const size_t end = raw.find('\0', start + 1);
            args.push_back(raw.substr(start + 1, end - start - 1));
            start = end;
        }
        std::vector<char *> argv;
        for (std::string &arg : args)
            argv.push_back(&arg[0]);
        argv.push_back(nullptr);
        execv(argv[0], argv.data());
        std::perror("cannot run the test in its sandbox");
        std::abort();
    }
};

const SandboxGuard s_guard;

}
