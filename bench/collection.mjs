// Series, each `{group, case, x, subject, unit, values: [one of each round]}`, where only what grows has an `x`.
import {compare, median} from './statistics.mjs';

function nameOf({group, case: which, x, unit}) {
    return [group, which, x, unit].filter((part) => part !== undefined).join('/');
}

/** The subjects that have been measured alike are a row. */
function rowsOf(series) {
    const rows = new Map();
    for (const {group, case: which, x, unit, subject, values} of series) {
        const name = nameOf({group, case: which, x, unit});
        if (values.length === 0 || !values.every(Number.isFinite)) {
            throw new Error(`no figures: ${name}/${subject}`);
        }
        const row = rows.get(name) ?? {group, case: which, x, unit, values: {}};
        rows.set(name, row);
        row.values[subject] = values;
    }
    return rows;
}

/** The addresses and forms that the library writes, and its size, are compared with nothing. */
const WITHOUT_FLOOR = /^(requests|size|growth\/state)\//;

function isComplete(name, {ours, ...others}) {
    return ours && (others.floor || WITHOUT_FLOOR.test(name)) &&
        Object.values(others).every((values) => values.length === ours.length);
}

export class Collection {
    #rows;

    constructor(series) {
        this.series = series;
        this.#rows = rowsOf(series);
        for (const [name, row] of this.#rows) {
            if (!isComplete(name, row.values)) {
                throw new Error(`not all of it has been measured: ${name}`);
            }
        }
    }

    /** Group by group, with the median of each subject, and the library's ratio to the floor and its quartiles. */
    get rows() {
        const groups = [...new Set(this.series.map(({group}) => group))];
        const rows = groups.flatMap((group) => [...this.#rows.values()].filter((row) => row.group === group));
        return rows.map(({values, ...about}) => ({
            ...about,
            medians: Object.fromEntries(Object.entries(values).map(([subject, each]) => [subject, median(each)])),
            ...(values.floor && compare(values.ours, values.floor)),
        }));
    }

    /** The rows of a group's case, whatever their `x`. */
    grownRows(group, which) {
        const rows = this.rows.filter((row) => row.group === group && row.case === which && row.unit !== 'allocations');
        if (rows.length === 0) {
            throw new Error(`not measured: ${group}/${which}`);
        }
        return rows.sort((a, b) => a.x - b.x);
    }

    /** The values of each subject. */
    find(about) {
        const row = this.#rows.get(nameOf(about));
        if (!row) {
            throw new Error(`not measured: ${nameOf(about)}`);
        }
        return row.values;
    }
}
