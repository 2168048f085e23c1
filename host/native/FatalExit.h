// Tells the author why the effect ended the process. The runtime ends it on a
// shader that does not compile, a program that does not link or a file it
// cannot open: it composes a report, prints nothing and exits with its site's
// number, as it must on the phone. On a desktop this exit handler prints that
// report in an author's words and removes what the host was half-way through
// writing. It runs on every exit, does nothing when no report was composed,
// and never calls into Java: the JVM is not expecting this exit.
#pragma once

#include <string>
#include <vector>

class FatalExit {
public:
    // Installs the handler once; `program` starts each message ("vi-player").
    static void watch(const std::string& program);
    // The asset folder the effect's asset names are searched in.
    static void setAssetDirectory(const std::string& directory);
    // A file or folder to remove if the effect ends the process.
    static void removeOnFatalExit(const std::string& path);
    // Those files and folders, for the crash handler.
    static const std::vector<std::string>& pathsToRemove();

private:
    static void onExit();
    static std::string explain(const std::string& detail, const std::string& function, int status);
    static std::string explainShader(const std::string& log, int status);
    static std::string explainFile(const std::string& name, bool isAsset, int status);
};
