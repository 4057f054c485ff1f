#pragma once

#include <boost/filesystem/path.hpp>

#include <string>

// The directories and files of the time synchronisation manager, on which all of its components
// agree. There are two layouts: the standard one, under the directory of multi-architecture
// libraries, and the shared one, in a folder under the installation's shared directory. The
// manager's own directory of the standard layout decides: if it exists, the layout is that one.
//
// The constructor works everything out, in this order, and asks the file system and the standard
// directories anew for each member. A standard directory that cannot be told is replaced by its
// usual place, with a warning in the system log. Raises boost::filesystem::filesystem_error if the
// file system cannot tell whether something exists.
struct tManagerFileLocations {
    tManagerFileLocations();

    const boost::filesystem::path& getServosDir() const { return servosDir; }

    bool usesStandardLayout;
    boost::filesystem::path baseDir; // sets the flag above, which the others read
    std::string configGeneratorPath;
    std::string commandLineToolPath;
    boost::filesystem::path timeReferencesDir;
    boost::filesystem::path timekeepersDir;
    boost::filesystem::path servosDir;
    boost::filesystem::path runtimeDir;
    std::string runtimeFile;
    boost::filesystem::path configDir;
    boost::filesystem::path stateDir;
    std::string managerConfigFile;
    std::string syncConfigFile;
    std::string pidFile;
    std::string daemonPath;
    std::string logFile;
};
