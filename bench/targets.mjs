// The targets of the library.
import {compare, median} from './statistics.mjs';

const LOGINS = ['azure', 'websphere'].flatMap((profile) => ['one authority', 'all authorities']
    .map((store) => `${profile}, ${store}`));

function ratio({ours, floor}) {
    return compare(ours, floor).ratio;
}

function difference({ours, floor}) {
    return median(ours) - median(floor);
}

/** Each with the value of the run, and whether it is met. */
export function judge(collection) {
    const verification = (which, unit = 'us CPU') => collection.find({group: 'verification', case: which, unit});
    const start = (which, unit) => collection.find({group: 'start', case: which, unit});
    const verifications = collection.rows.filter((row) => row.group === 'verification' && row.unit === 'allocations');
    const allocations = verifications.map((row) => difference(verification(row.case, 'allocations')));
    const [rs256, hs256] = ['RS256, 2048 bits, 1024 B', 'HS256, 1024 B'];

    return [
        {target: `${rs256}: time, ratio to the floor`, most: 1.03, value: ratio(verification(rs256))},
        {target: `${hs256}: time, ratio to the floor`, most: 1.03, value: ratio(verification(hs256))},
        {target: 'verification: allocations beyond the floor', most: 8, value: Math.max(...allocations)},
        ...LOGINS.map((which) => ({
            target: `login, ${which}: CPU, ratio to the bare program`,
            most: 1.02,
            value: ratio(collection.find({group: 'login', case: which, unit: 'us CPU'})),
        })),
        {target: 'loading: time, ratio to the dependencies', most: 1.03, value: ratio(start('process', 'us wall'))},
        {
            target: 'loading: private memory beyond the dependencies, kB',
            most: 150,
            value: difference(start('private memory, alone', 'kB')),
        },
        {
            target: 'stripped library, kB',
            most: 160,
            value: median(collection.find({group: 'size', case: 'stripped library', unit: 'kB'}).ours),
        },
        {
            target: 'key set of 10,000 keys: time, ratio to its parsing alone',
            most: 1.1,
            value: ratio(collection.find({group: 'growth', case: 'key set', x: 10000, unit: 'us CPU'})),
        },
    ].map((each) => ({...each, held: each.value <= each.most}));
}
