#ifndef TAVOSSO_BENCH_LOGIN_EXCHANGE_H
#define TAVOSSO_BENCH_LOGIN_EXCHANGE_H

// What the client sends to its provider, which answers nothing else: so both programs that log in send the same.
#define CLIENT_ID "6731de76-14a6-49ae-97bc-6eba6914391e"
#define CLIENT_SECRET "JqQX2PNo9bpM0uEihUPzyrh"
#define CODE "OAAABAAAAiL9Kn2Z27UubvWFPbm0gLWQJVzCTE9UkP3pSx1aXxUjq3n8b2JRLk4OxVXr"
#define REDIRECT_URI "https://nas.example/return"

#define TOKEN_REQUEST                                                    \
    "client_id=" CLIENT_ID "&client_secret=" CLIENT_SECRET "&code=" CODE \
    "&grant_type=authorization_code"                                     \
    "&redirect_uri=https%3A%2F%2Fnas.example%2Freturn"

// Where it is sent, below the provider's address and the profile's name.
#define TOKEN_PATH "/token"
#define DISCOVERY_PATH "/discovery"
#define KEYS_PATH "/keys"

#endif
