/** Between the values, where the quantile is none of them. */
export function quantile(values, part) {
    const sorted = [...values].sort((a, b) => a - b);
    const position = part * (sorted.length - 1);
    const below = sorted[Math.floor(position)];
    return below + (sorted[Math.ceil(position)] - below) * (position % 1);
}

export function median(values) {
    return quantile(values, 1 / 2);
}

/**
 * Of what two series have for the same rounds: the machine is slower at one time than at another, and in a round it has
 * been the same for both.
 */
export function compare(values, others) {
    const ratios = values.map((value, i) => value / others[i]);
    return {ratio: median(ratios), quartiles: [quantile(ratios, 1 / 4), quantile(ratios, 3 / 4)]};
}
