#ifndef TAVOSSO_UTILS_SOURCE_LINE_H
#define TAVOSSO_UTILS_SOURCE_LINE_H

// The two arguments behind the "%s:%d" with which every log line begins. Each source that logs names itself in a
// constant kSourceName: administrators search for these names, so they must not follow the way __FILE__ is spelt by
// whoever runs the compiler.
#define SOURCE_LINE kSourceName, __LINE__

#endif
