// What a run has given, for people.
const FIRST_SUBJECTS = ['ours', 'floor'];

/** With four digits that count. */
function format(number) {
    if (number === undefined) {
        return '';
    }
    return String(Math.abs(number) >= 1000 ? Math.round(number) : Number(number.toPrecision(4)));
}

function formatRatio(ratio) {
    return Number.isFinite(ratio) ? ratio.toFixed(3) : '';
}

/** In Markdown, so that a document can have it as it is: texts to the left, numbers to the right. */
function layOut([header, ...lines], texts) {
    const widths = header.map((_, column) => Math.max(3, ...[header, ...lines].map((line) => line[column].length)));
    const rule = widths.map((width, column) => column < texts ? '-'.repeat(width) : `${'-'.repeat(width - 1)}:`);
    return [header, rule, ...lines].map((line) => line
        .map((cell, column) => column < texts ? cell.padEnd(widths[column]) : cell.padStart(widths[column]))
        .join(' | ')).map((line) => `| ${line} |`).join('\n');
}

function layOutRows(rows) {
    const measured = new Set(rows.flatMap((row) => Object.keys(row.medians)));
    const subjects = [...new Set([...FIRST_SUBJECTS, ...measured])];
    return layOut([
        ['group', 'case', 'unit', ...subjects, 'ratio', 'spread'],
        ...rows.map(({group, case: which, x, unit, medians, ratio, quartiles = []}) => [
            group,
            x === undefined ? which : `${which}, ${x}`,
            unit,
            ...subjects.map((subject) => format(medians[subject])),
            formatRatio(ratio),
            quartiles.map(formatRatio).filter(Boolean).join('–'),
        ]),
    ], 3);
}

function layOutTargets(targets) {
    return layOut([
        ['target', '', 'limit', 'this run'],
        ...targets.map(({target, most, value, held}) => [
            target,
            held ? 'held' : 'missed',
            `≤ ${most}`,
            format(value),
        ]),
    ], 2);
}

export function formatReport({machine, quick, rows, targets}) {
    return `On ${machine}${quick ? '. A quick run: its figures are coarse' : ''}.
Each figure is the median of a run's rounds; so is the ratio of ours to the floor, of which the spread is the quartiles.
Of Google Benchmark's repetitions a round takes the median.

${layOutRows(rows)}

${layOutTargets(targets)}`;
}
