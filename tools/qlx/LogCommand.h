// `qlx log`: the lines of its inputs, or one message of a resource bundle, to a logger.
#ifndef QLX_TOOLS_LOGCOMMAND_H
#define QLX_TOOLS_LOGCOMMAND_H

#include <string>
#include <vector>

struct LogOptions {
  std::string config;  // empty: the toolkit opens without a file
  std::string logger;
  std::string level = "INFO";
  std::string bundle, key;          // both empty, or both set
  std::vector<std::string> inputs;  // files; with a bundle, the message's arguments
};

// Returns the exit status of the command.
int runLogCommand(const LogOptions &options);

#endif
