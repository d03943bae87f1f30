// The commands of the documents that are not run as they stand, each with what is run for it, or why nothing is.

/** Commands of blocks that are not run here, and why. */
export const ELSEWHERE = new Map([
    ['./check', 'is what runs this'],
    ['bench/run', 'takes a quarter of an hour; ./check bench runs it for a minute'],
    ['tests/release/package/machine --clone /home/ada/tavosso --user ada ./check style', 'is how these commands are run'],
]);

/** Commands within the text that cannot be run to the letter, and what is run for them. */
export const FILLED_IN = new Map([
    ['./demo serve', 'until_it_waits ./demo serve'],
    ['./demo serve websphere', 'until_it_waits ./demo serve websphere'],
    ['cmake --preset release -DTAVOSSO_PLATFORM_LIBRARIES="/path/to/one.so;/path/to/other.so"',
        'cmake --preset release -B build/appliance -DTAVOSSO_PLATFORM_LIBRARIES=/usr/local/lib/libtavoplatform.so.0' +
        ' && cmake --build build/appliance --target tavosso'],
    ['g++ -std=c++17 sso.cpp -o sso.cgi $(pkg-config --cflags --libs tavosso)',
        'cd build/first && g++ -std=c++17 sso.cpp -o sso.cgi $(pkg-config --cflags --libs tavosso)'],
    ['g++ -std=c++17 login.cpp -o login.cgi $(pkg-config --cflags --libs tavosso)',
        'mkdir build/guide && tests/release/consumer/programs build/guide && cd build/guide/guide &&' +
        ' g++ -std=c++17 login.cpp -o login.cgi $(pkg-config --cflags --libs tavosso)'],
    [
        'sudo apt-get install ./libtavosso6_*.deb ./libtavoplatform0_*.deb ./libtavosso-common_*.deb' +
        ' ./tavosso-frontend_*.deb',
        'cd .. && apt-get install ./libtavosso6_*.deb ./libtavoplatform0_*.deb ./libtavosso-common_*.deb' +
        ' ./tavosso-frontend_*.deb',
    ],
    ['sudo lighty-disable-mod tavosso-frontend',
        'lighty-enable-mod tavosso-frontend && lighty-disable-mod tavosso-frontend'],
    ['sudo lighty-disable-mod ssl', 'lighty-enable-mod ssl && lighty-disable-mod ssl'],
    ['update-ca-certificates', 'sudo update-ca-certificates'],
    ['#!/bin/sh\nexec timeout 60 "$DOCUMENT_ROOT$SCRIPT_NAME"',
        'export DOCUMENT_ROOT=/usr SCRIPT_NAME=/bin/true && exec timeout 60 "$DOCUMENT_ROOT$SCRIPT_NAME"'],
    ['c++ -std=c++17 program.cpp $(pkg-config --cflags --libs tavosso)',
        'cd build/first && cp sso.cpp program.cpp &&' +
        ' c++ -std=c++17 program.cpp $(pkg-config --cflags --libs tavosso)'],
    ['clang-format -i FILE', 'clang-format -i sso/sso.cpp'],
    ['git shortlog -se', 'git shortlog -se HEAD'], // it would read from what is no terminal
    ['man tavosso-doctor', 'man ./docs/man/tavosso-doctor.8'],
    ['tavosso-doctor', 'tavosso-doctor || [ $? = 1 ]'], // no profile is set up there
    ['tavosso-doctor explain TEXT', 'tavosso-doctor explain "profile not support."'],
    ['sudo tavosso-doctor --domain corp.example.net', 'sudo tavosso-doctor --domain corp.example.net || [ $? = 1 ]'],
    ['sudo tavosso-doctor --user www-data', 'sudo tavosso-doctor --user www-data || [ $? = 1 ]'],
    ['ls -l FILE', 'ls -l build/first/profile.conf'],
    ['python3 -m json.tool FILE', 'python3 -m json.tool build/first/profile.conf'],
]);

/** Commands within the text that are not run here, and why. */
export const NOT_HERE = new Map([
    ['./check bench', 'on request: it builds the benchmarks and what they compare with'],
    ['./check coverage', 'on request: it takes long'],
    ['./check fortify', 'the same'],
    ['./check fuzz', 'the same'],
    ['./check memcheck', 'the same'],
    ['./check soak', 'the same'],
    ['cmake --install', 'names the command of the README'],
    ['ctest', 'names a program'],
    ['git commit', 'by hand'],
    ['git grep', 'names a command'],
    ['git tag -a vVERSION', 'by hand'],
    ['lintian', 'names a program: ./check package runs it'],
    ['man', 'names a program'],
    ['node tests/mutation/run.mjs', 'by hand: an hour'],
    ['openssl s_server -www', 'tells how a figure was measured'],
    ['pre-commit', 'names a program: ./check style runs it'],
    ['sudo lighty-enable-mod ssl tavosso-frontend', 'needs the package: tests/package reads it there and runs it'],
    ['sudo systemctl restart lighttpd', 'needs systemd to run: tests/package restarts it by its script'],
    ['sudo tavosso-doctor login', 'asks a person: tests/doctor answers it'],
    ['tavosso-doctor login', 'the same'],
    ['tavosso-doctor token FILE', 'needs a token: tests/doctor has them'],
    ['tests/fuzz/search --hours 1', 'by hand: an hour'],
    ['tests/fuzz/search --report', 'by hand, after that'],
]);
