# SPDX-FileCopyrightText: the libjni_kyface_api authors
# SPDX-License-Identifier: Apache-2.0
"""The counts that are kept, and how new ones compare with them."""

# What an operation may need beyond its record, as a part of it.
TOLERANCE = 0.02


def figures(counts, calls):
    """What is kept: {operation: {size: instructions per pixel}}, and of native methods and the engine
    {name: {"call": instructions}}."""
    result = {}
    for key, count in counts.items():
        result.setdefault(key.operation, {})[key.size] = round(count.per_pixel, 4)
    for name, count in calls.items():
        result[name] = {"call": round(count.instructions, 1)}
    return result


def difference(recorded, here):
    """Why counts made with the tools `here` say nothing beside those made with `recorded`, each {tool: version}: a
    sentence, or nothing where the tools are the same."""
    if recorded == here:
        return None
    before, now = (" and ".join(f"{tool} {version}" for tool, version in tools.items()) for tools in (recorded, here))
    return f"the counts were recorded with {before}; those of {now} are not comparable"


def complaints(recorded, measured):
    """Why `measured` is not as good as `recorded`, a line for each figure; nothing when it is."""
    lines = []
    for operation in sorted({*recorded, *measured}):
        before, now = recorded.get(operation, {}), measured.get(operation, {})
        for per in sorted({*before, *now}):
            if per not in now:
                lines.append(f"{operation}, {per}: recorded, but not measured")
            elif per not in before:
                lines.append(f"{operation}, {per}: {now[per]} instructions, none recorded")
            elif now[per] > before[per] * (1 + TOLERANCE):
                more = 100 * (now[per] / before[per] - 1)
                lines.append(f"{operation}, {per}: {now[per]} instructions, {before[per]} recorded (+{more:.1f} %)")
    return lines
