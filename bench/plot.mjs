// How the library grows, as pictures: both axes are logarithmic, so that a straight line is a power of what grows.
const WIDTH = 640;
const HEIGHT = 400;
const AREA = {left: 76, right: 620, top: 62, bottom: 340};

/** By the pictures' names. The floor is another one in each, if there is one. */
const PLOTS = {
    'token-size': {
        case: 'token size',
        title: 'A verification, by the size of the token',
        x: 'bytes of claims',
        floor: 'the calls it cannot do without',
    },
    'key-set-size': {
        case: 'key set',
        title: 'A verification, by the size of the provider’s key set',
        x: 'keys in the set',
        floor: 'parsing the set alone',
    },
    'state-size': {
        case: 'state',
        title: 'A redirection to the provider, by the size of the state',
        x: 'bytes of state',
    },
    processes: {
        case: 'CGI processes at once',
        title: 'First requests, by how many are served at once',
        x: 'CGI processes at once',
        floor: 'loading the dependencies alone',
    },
};
const MICROSECONDS = {'us CPU': 1, 'ms wall': 1000};
const TIMES = [[1e6, 's'], [1e3, 'ms'], [1, 'µs'], [1e-3, 'ns']];
const COUNTS = [[1e6, ' M'], [1e3, ' k'], [1, '']];

/** Told apart without colours, too. The colours and the grey can be read on white and on black. */
const LINES = {
    floor: {colour: '#2f81c7', dashes: '6 4', mark: ([x, y]) => `<path d="M${x - 4} ${y - 4}h8v8h-8z"/>`},
    ours: {colour: '#d4620f', dashes: 'none', mark: ([x, y]) => `<circle cx="${x}" cy="${y}" r="4"/>`},
};
const STYLE = `text { font: 13px sans-serif; fill: #7a7a7a }
.title { font-size: 15px; font-weight: bold }
.grid { stroke: #8884; fill: none }
.line { stroke-width: 2; fill: none }`;

function round(number) {
    return Number(number.toFixed(1));
}

function format(value, units, separator = '') {
    const [size, unit] = units.find(([each]) => value >= each) ?? units.at(-1);
    return `${Number((value / size).toPrecision(3))}${separator}${unit}`;
}

function escape(text) {
    return text.replaceAll('&', '&amp;').replaceAll('<', '&lt;');
}

function write([x, y], content, attributes = '') {
    return `<text x="${round(x)}" y="${round(y)}" ${attributes}>${escape(content)}</text>`;
}

/** Powers of ten, and where these are few, their double and fivefold. */
function ticksBetween(least, most) {
    const steps = most / least > 500 ? [1] : [1, 2, 5];
    const decades = Math.ceil(Math.log10(most / least)) + 1;
    const first = Math.floor(Math.log10(least));
    return Array.from({length: decades + 1}, (_, i) => steps.map((step) => Number(`${step}e${first + i}`))).flat()
        .filter((tick) => tick >= least && tick <= most);
}

/** From values to a side of the picture, with room around them: where they hardly differ, for them to look so. */
function makeAxis(values, from, to) {
    const [first, last] = [Math.min(...values), Math.max(...values)];
    const middle = Math.sqrt(first * last);
    const least = Math.min(first / 1.2, middle / 4);
    const most = Math.max(last * 1.2, middle * 4);
    return {
        place: (value) => round(from + (to - from) * Math.log(value / least) / Math.log(most / least)),
        ticks: ticksBetween(least, most),
    };
}

function drawGrid(xAxis, yAxis) {
    const {left, right, top, bottom} = AREA;
    return [
        `<path class="grid" d="M${left} ${top}H${right}V${bottom}H${left}z"/>`,
        ...xAxis.ticks.flatMap((tick) => [
            `<path class="grid" d="M${xAxis.place(tick)} ${top}V${bottom}"/>`,
            write([xAxis.place(tick), bottom + 19], format(tick, COUNTS), 'text-anchor="middle"'),
        ]),
        ...yAxis.ticks.flatMap((tick) => [
            `<path class="grid" d="M${left} ${yAxis.place(tick)}H${right}"/>`,
            write([left - 8, yAxis.place(tick) + 4], format(tick, TIMES, ' '), 'text-anchor="end"'),
        ]),
    ];
}

function drawLine({colour, dashes, mark}, points) {
    return [
        `<path class="line" stroke="${colour}" stroke-dasharray="${dashes}" d="M${points.map((p) => p.join(' ')).join('L')}"/>`,
        `<g fill="${colour}">${points.map(mark).join('')}</g>`,
    ];
}

function drawLegend(names) {
    return Object.entries(names).flatMap(([subject, name], i) => {
        const [x, y] = [AREA.left + 12, AREA.top + 18 + 20 * i];
        return [...drawLine(LINES[subject], [[x, y], [x + 36, y]]), write([x + 48, y + 4], name)];
    });
}

function describe(points, names) {
    const tell = ({x, times}) => `at ${format(x, COUNTS)}: ` +
        Object.keys(names).map((subject) => `${names[subject]} ${format(times[subject], TIMES, ' ')}`).join(', ');
    return points.map(tell).join('; ');
}

/** `points` are `{x, times: {ours, floor}}` in microseconds, and `floor` says what the floor is. Ours is on top. */
function draw({title, x, floor}, points) {
    const names = {...(floor && {floor}), ours: 'the library'};
    const xAxis = makeAxis(points.map((point) => point.x), AREA.left, AREA.right);
    const yAxis = makeAxis(points.flatMap((point) => Object.values(point.times)), AREA.bottom, AREA.top);
    const middle = (AREA.left + AREA.right) / 2;
    return `<svg xmlns="http://www.w3.org/2000/svg" viewBox="0 0 ${WIDTH} ${HEIGHT}" role="img"
    aria-labelledby="title description">
<title id="title">${escape(title)}</title>
<desc id="description">${escape(`Time ${describe(points, names)}`)}</desc>
<style>${STYLE}</style>
${[
    write([AREA.left, 32], title, 'class="title"'),
    ...drawGrid(xAxis, yAxis),
    write([middle, AREA.bottom + 44], x, 'text-anchor="middle"'),
    ...Object.keys(names).flatMap((subject) => drawLine(LINES[subject],
        points.map((point) => [xAxis.place(point.x), yAxis.place(point.times[subject])]))),
    ...drawLegend(names),
].join('\n')}
</svg>
`;
}

/** The pictures of a run by their names. */
export function plotGrowth(collection) {
    return Object.fromEntries(Object.entries(PLOTS).map(([name, plot]) => {
        const points = collection.grownRows('growth', plot.case).map(({x, unit, medians}) => ({
            x,
            times: Object.fromEntries(Object.entries(medians)
                .map(([subject, time]) => [subject, time * MICROSECONDS[unit]])),
        }));
        return [name, draw(plot, points)];
    }));
}
