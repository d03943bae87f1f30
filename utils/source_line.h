#ifndef TAVOSSO_UTILS_SOURCE_LINE_H
#define TAVOSSO_UTILS_SOURCE_LINE_H

// Arguments for the "%s:%d " of a log line. Each source that logs defines kSourceName. Administrators search for these
// names; __FILE__ depends on the compiler's command line.
#define SOURCE_LINE kSourceName, __LINE__

#endif
