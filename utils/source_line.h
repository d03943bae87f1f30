#ifndef TAVOSSO_UTILS_SOURCE_LINE_H
#define TAVOSSO_UTILS_SOURCE_LINE_H

// The arguments of the "%s:%d " that begins every log line. Each source that logs defines kSourceName, not __FILE__:
// administrators search for these names, and __FILE__ depends on the compiler's command line.
#define SOURCE_LINE kSourceName, __LINE__

#endif
