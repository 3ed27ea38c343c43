#include "tools/lint/ConfigLinter.h"

#include <vector>

#include "tools/lint/CommandRules.h"
#include "tools/lint/Explainer.h"
#include "tools/lint/LoadChecker.h"
#include "tools/lint/LoaderRun.h"
#include "tools/lint/LocatedConfig.h"
#include "tools/lint/ValueChecker.h"

namespace velmora {

ConfigLinter::ConfigLinter(std::string path, LintOptions options)
    : mPath(std::move(path)), mOptions(options), mDiagnostics(mPath) {}

int ConfigLinter::run(std::ostream& out) {
    LoaderRun loader;
    loader.run(mPath);
    LocatedConfig located;
    located.load(mPath);
    return report(loader, located, out);
}

int ConfigLinter::runText(const std::string& text, std::ostream& out) {
    LoaderRun loader;
    loader.runText(text);
    LocatedConfig located;
    located.parse(text);
    return report(loader, located, out);
}

int ConfigLinter::report(const LoaderRun& loader, const LocatedConfig& located,
                         std::ostream& out) {
    std::vector<CheckedCommand> commands;
    LoadChecker loadChecker(located, loader, mDiagnostics);
    if (loadChecker.check(&commands)) {
        CommandRules rules(mDiagnostics, located.rootLine());
        rules.check(commands);
        const NodeMap nodes(mOptions.device != nullptr ? *mOptions.device
                                                       : DeviceProfile::builtIn());
        ValueChecker(nodes, mDiagnostics).check(commands);
        if (mOptions.explain) {
            Explainer(out).explain(commands);
        }
    }
    mDiagnostics.print(out, mOptions.explain);
    return mDiagnostics.exitStatus(mOptions.werror);
}

}  // namespace velmora
