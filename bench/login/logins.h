#ifndef TAVOSSO_BENCH_LOGIN_LOGINS_H
#define TAVOSSO_BENCH_LOGIN_LOGINS_H

#ifdef __cplusplus
extern "C" {
#endif

// Logs in once for all that is made only once, then so many times, and prints as JSON what one of these took.
void MeasureLogins(unsigned long logins, void (*logIn)(void));

#ifdef __cplusplus
}
#endif

#endif
