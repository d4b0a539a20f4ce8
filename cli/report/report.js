"use strict";
// Draws a report. Every number in a table stands in an element with the attributes data-name, its
// name in the output of --json, and data-value, the number as it is there.
(function () {
    const data = JSON.parse(document.getElementById("data").textContent);
    const main = document.querySelector("main");
    const charts = [];
    const color = (name) => getComputedStyle(document.documentElement).getPropertyValue("--" + name).trim();

    function add(parent, tag, text, attributes) {
        const element = document.createElement(tag);
        if (text !== undefined && text !== null) element.textContent = text;
        for (const [name, value] of Object.entries(attributes || {})) element.setAttribute(name, value);
        parent.appendChild(element);
        return element;
    }

    const percent = (share) => share === null ? "-" : (share * 100).toFixed(1);
    const latency = (ms) => ms === null ? "-" : String(ms);
    const settingName = (vad) => vad === "" ? "(defaults)" : vad;

    function head(title, lines) {
        add(main, "h1", title);
        for (const line of lines) add(main, "p", line, {class: "faint"});
    }

    // ---- charts ----

    function makeChart(title, options, extra) {
        const parent = extra && extra.parent || main;
        if (title) add(parent, "h2", title);
        const box = add(parent, "div", null, {class: "chart" + (extra && extra.tall ? " tall" : "")});
        if (extra && extra.height) box.style.height = extra.height + "px";
        const canvas = add(box, "canvas", null, {role: "img", "aria-label": title || "chart"});
        const make = () => {
            const settings = options();
            settings.options = Object.assign({
                animation: false, responsive: true, maintainAspectRatio: false,
            }, settings.options);
            return new Chart(canvas, settings);
        };
        const entry = {chart: make(), make};
        charts.push(entry);
        return entry;
    }

    function axis(title, more) {
        return Object.assign({
            title: {display: true, text: title, color: color("faint")},
            ticks: {color: color("faint")},
            grid: {color: color("line")},
        }, more);
    }

    function legend() {
        return {labels: {color: color("text"), boxHeight: 2, boxWidth: 22}};
    }

    /** Makes charts over time, one below the other; a click plays the sound from there. */
    function timeCharts({audio, fromS, soundBeginS, toS, yWidth, marks, parent}) {
        return (title, datasets, y, extra) => makeChart(title, () => ({
            type: "line",
            data: {datasets: datasets()},
            plugins: [marks].concat(extra && extra.plugin ? [extra.plugin] : []),
            options: {
                parsing: false, normalized: true,
                elements: {point: {radius: 0}, line: {borderWidth: 1.2}},
                interaction: {mode: "nearest", axis: "x", intersect: false},
                onClick(event, _, chart) {
                    if (audio) audio.currentTime = Math.max(0, chart.scales.x.getValueForPixel(event.x) - soundBeginS);
                },
                scales: {
                    x: axis("s", {type: "linear", min: fromS, max: toS}),
                    // The same width in each chart, so that a moment stands below itself.
                    y: axis(y.title, Object.assign({afterFit: (scale) => { scale.width = yWidth; }}, y)),
                },
                plugins: {legend: datasets().length > 1 ? legend() : {display: false}, decimation: {enabled: false}},
            },
        }), Object.assign({parent}, extra));
    }

    function waveform(wave, beginS) {
        const at = (index) => beginS + index * wave.stepMs / 1000;
        return [
            {label: "highest", data: wave.max.map((y, i) => ({x: at(i), y})), borderColor: color("one"),
                backgroundColor: color("one"), fill: "+1"},
            {label: "lowest", data: wave.min.map((y, i) => ({x: at(i), y})), borderColor: color("one")},
        ];
    }

    /** Draws the charts while the sound plays, which mark its place. */
    function follow(audio) {
        const draw = () => {
            for (const {chart} of charts) chart.draw();
            if (!audio.paused) requestAnimationFrame(draw);
        };
        audio.addEventListener("play", draw);
        audio.addEventListener("seeked", draw);
    }

    function redraw() {
        for (const entry of charts) {
            entry.chart.destroy();
            entry.chart = entry.make();
        }
    }
    matchMedia("(prefers-color-scheme: dark)").addEventListener("change", redraw);

    // ---- tables ----

    /** columns: [name, heading, format, path]; a path such as "early.value" leads to the number. */
    function cell(row, name, value, text) {
        return add(row, "td", text, {
            "data-name": name, "data-value": value === null || value === undefined ? "null" : String(value),
        });
    }

    function table(headings, className, parent) {
        const box = add(parent || main, "div", null, {class: "scroll"});
        const element = add(box, "table", null, className ? {class: className} : {});
        const row = add(add(element, "thead"), "tr");
        for (const heading of headings) add(row, "th", heading);
        return add(element, "tbody");
    }

    // ---- one sound ----

    function vadReport() {
        head(data.file, [
            data.version + ", " + data.rateHz + " Hz, " + (data.lengthMs / 1000).toFixed(2) + " s",
        ]);
        const setting = add(main, "p", "Parameters: ");
        add(setting, "code", settingName(data.vad));
        const noise = add(main, "p", "Leading noise: ");
        add(noise, "span", data.noiseLevel === null ? "-" : data.noiseLevel.toFixed(1),
            {"data-name": "noiseLevel", "data-value": String(data.noiseLevel)});
        add(noise, "span", data.noiseRow
            ? " dB; the row from " + data.noiseRow.fromLevel + " dB applies: individual=" + data.noiseRow.individual +
              ", total=" + data.noiseRow.total + ", overhangmax1=" + data.noiseRow.overhangmax1 +
              ", overhangmax2=" + data.noiseRow.overhangmax2
            : " dB; " + (data.hasOwnThresholds ? "the parameters set the thresholds." : "below the first row of noise thresholds."));
        const audio = data.audio ? add(main, "audio", null, {controls: "", src: data.audio}) : null;
        if (!audio) add(main, "p", "The sound is too long to be part of this page.", {class: "faint"});

        const lengthS = data.lengthMs / 1000;
        const eventColor = (event) => color({recordingBegin: "faint", speakingBegin: "three"}[event] || "bad");
        // Marks on every chart: labels as bands, events as lines, the place of the playback.
        const marks = {
            id: "marks",
            beforeDatasetsDraw(chart) {
                const {ctx, chartArea: area, scales: {x}} = chart;
                ctx.save();
                ctx.fillStyle = color("mark");
                for (const label of data.labels) {
                    const from = x.getPixelForValue(label.startMs / 1000);
                    ctx.fillRect(from, area.top, x.getPixelForValue(label.endMs / 1000) - from, area.height);
                }
                ctx.restore();
            },
            afterDatasetsDraw(chart) {
                const {ctx, chartArea: area, scales: {x}} = chart;
                const line = (ms, name, dashed) => {
                    const at = x.getPixelForValue(ms / 1000);
                    if (at < area.left || at > area.right) return;
                    ctx.strokeStyle = name;
                    ctx.setLineDash(dashed ? [4, 3] : []);
                    ctx.beginPath();
                    ctx.moveTo(at, area.top);
                    ctx.lineTo(at, area.bottom);
                    ctx.stroke();
                };
                ctx.save();
                ctx.lineWidth = 1.5;
                for (const event of data.events) {
                    line(event.ms, eventColor(event.event), false);
                }
                for (const segment of data.segments) {
                    line(segment.startMs, color("three"), true);
                    if (segment.ended) line(segment.endMs, color("bad"), true);
                }
                if (audio) line(audio.currentTime * 1000, color("text"), false);
                ctx.restore();
            },
        };
        const timeChart = timeCharts({audio, fromS: 0, soundBeginS: 0, toS: lengthS, yWidth: 64, marks});
        timeChart("Waveform", () => waveform(data.wave, 0), {title: "sample"});
        const points = (value) => data.buffers.map((buffer) => ({x: buffer.endMs / 1000, y: value(buffer)}));
        timeChart("Level", () => [
            {label: "level", data: points((buffer) => buffer.learningNoise || buffer.silence ? null : buffer.level),
                borderColor: color("one")},
        ], {title: "dB"});
        timeChart("Activity and thresholds", () => [
            {label: "activity", data: points((buffer) => buffer.learningNoise ? null : buffer.activity),
                borderColor: color("one")},
            {label: "above it speech begins (activityon)", borderColor: color("three"), borderDash: [6, 4],
                data: [{x: 0, y: data.activityOn}, {x: lengthS, y: data.activityOn}]},
            {label: "below it speech ends (activityoff)", borderColor: color("bad"), borderDash: [6, 4],
                data: [{x: 0, y: data.activityOff}, {x: lengthS, y: data.activityOff}]},
        ], {title: "share", min: 0, max: 1});
        timeChart("Frames that count as speech", () => [{
            label: "frame", stepped: "before", fill: "origin", borderWidth: 0, backgroundColor: color("two"),
            data: data.buffers.flatMap((buffer) => [...buffer.frames].map((frame, i) => ({
                x: (buffer.startMs + (i + 1) * (buffer.endMs - buffer.startMs) / buffer.frames.length) / 1000,
                y: Number(frame),
            }))),
        }], {title: "", min: 0, max: 1, ticks: {display: false}});
        if (audio) follow(audio);
        add(main, "p", "Bands are the labels; solid lines what a session reports (recording begun grey, speech begun green, the end red), dashed ones where the detector's speech begins and ends. Click into a chart to play from there.", {class: "faint"});

        add(main, "h2", "What a session reports");
        const events = table(["event", "after ms"]);
        for (const event of data.events) {
            const row = add(events, "tr");
            add(row, "td", event.name ? event.event + ": " + event.name : event.event);
            cell(row, "ms", event.ms, event.ms);
        }
        add(main, "h2", "Segments of speech");
        const segments = table(["", "from ms", "to ms"]);
        data.segments.forEach((segment, index) => {
            const row = add(segments, "tr");
            add(row, "td", segment.ended ? "speech " + (index + 1) : "speech " + (index + 1) + ", open at the end");
            cell(row, "startMs", segment.startMs, segment.startMs);
            cell(row, "endMs", segment.endMs, segment.endMs);
        });
    }

    // ---- score ----

    function estimate(row, name, figure, format) {
        const element = cell(row, name, figure.value, format(figure.value));
        if (figure.low !== null && figure.value !== null) {
            add(element, "small", " " + format(figure.low) + " to " + format(figure.high));
        }
    }

    function scoreReport() {
        head("How speech begins and ends: " + data.folder, [data.version]);
        const settings = [...new Set(data.rows.map((row) => row.vad))];
        const groups = [...new Set(data.rows.filter((row) => row.kind === "group").map((row) => row.name))];
        const names = ["one", "two", "three", "bad", "faint"];
        const bars = (title, y, value) => makeChart(title, () => ({
            type: "bar",
            data: {
                labels: groups,
                datasets: settings.map((vad, index) => ({
                    label: settingName(vad), backgroundColor: color(names[index % names.length]),
                    data: groups.map((name) => {
                        const row = data.rows.find((one) => one.vad === vad && one.kind === "group" && one.name === name);
                        return row ? value(row) : null;
                    }),
                })),
            },
            options: {
                scales: {x: axis(""), y: axis(y, {beginAtZero: true})},
                plugins: {legend: legend()},
            },
        }));
        bars("Ended early", "%", (row) => row.early.value === null ? null : row.early.value * 100);
        bars("Latency of the end", "ms, median", (row) => typeof row.endLateMs.value === "number" ? row.endLateMs.value : null);
        bars("False begins", "%", (row) => row.falseBegin.value * 100);
        for (const vad of settings) {
            add(main, "h2", settingName(vad));
            const body = table(["", "sessions", "missed %", "false begin %", "begin late ms", "90 %",
                "ended early %", "never ended %", "end late ms", "90 %", "excess ms"]);
            for (const one of data.rows.filter((row) => row.vad === vad)) {
                const row = add(body, "tr", null, {"data-row": one.kind + " " + one.name});
                add(row, "td", one.kind === "pause" ? "pause " + one.name : one.name);
                cell(row, "sessions", one.sessions, one.sessions);
                estimate(row, "missed", one.missed, percent);
                estimate(row, "falseBegin", one.falseBegin, percent);
                estimate(row, "beginLateMs", one.beginLateMs, latency);
                cell(row, "beginLateP90Ms", one.beginLateMs.p90, latency(one.beginLateMs.p90));
                estimate(row, "early", one.early, percent);
                estimate(row, "unended", one.unended, percent);
                estimate(row, "endLateMs", one.endLateMs, latency);
                cell(row, "endLateP90Ms", one.endLateMs.p90, latency(one.endLateMs.p90));
                estimate(row, "excessMs", one.excessMs, latency);
            }
        }
        add(main, "p", "Small numbers are the bounds at a confidence of 95 %, by bootstrap over the sessions.", {class: "faint"});
    }

    // ---- sweep ----

    /** From green over yellow to red. */
    function heat(share) {
        return "hsl(" + Math.round(130 * (1 - Math.min(1, Math.max(0, share)))) + " 65% 68%)";
    }

    function values(vad) {
        return Object.fromEntries(vad.split(";").filter(Boolean).map((part) => part.split("=")));
    }

    function heatMap(title, name, format, pick) {
        const axes = data.axes.filter((one) => one.values.length > 1).slice(0, 2);
        if (axes.length < 2) return;
        const advised = values(data.advice.vad);
        const others = data.axes.filter((one) => !axes.includes(one)).map((one) => one.name);
        const shown = data.points.filter((point) => others.every((other) => values(point.vad)[other] === advised[other]));
        const numbers = shown.map(pick).filter((value) => typeof value === "number");
        const lowest = Math.min(...numbers), highest = Math.max(...numbers);
        add(main, "h2", title);
        if (others.length) {
            add(main, "p", "with " + others.map((other) => other + "=" + advised[other]).join(", "), {class: "faint"});
        }
        const body = table([axes[0].name + " \\ " + axes[1].name, ...axes[1].values], "heat");
        for (const first of axes[0].values) {
            const row = add(body, "tr");
            add(row, "td", first);
            for (const second of axes[1].values) {
                const point = shown.find((one) => values(one.vad)[axes[0].name] === first && values(one.vad)[axes[1].name] === second);
                const value = point ? pick(point) : null;
                const element = cell(row, name, value, format(value));
                if (point) element.title = point.vad;
                element.style.background = typeof value === "number"
                    ? heat(highest > lowest ? (value - lowest) / (highest - lowest) : 0) : heat(1);
            }
        }
    }

    function sweepReport() {
        head("Trade-offs of the end of speech: " + data.folder, [data.version, data.points.length + " points"]);
        const advice = add(main, "p", (data.advice.meetsWanted ? "What to set" : "No point meets what is wanted; the nearest is") + ": ");
        add(advice, "code", settingName(data.advice.vad));
        const finite = data.points.filter((point) => typeof point.endLateMs === "number" && point.lost !== null);
        const toXy = (point) => ({x: point.endLateMs, y: point.lost * 100, vad: point.vad});
        makeChart("Words lost against latency", () => ({
            type: "scatter",
            data: {
                datasets: [
                    {label: "chosen", data: finite.filter((point) => point.vad === data.advice.vad).map(toXy),
                        pointRadius: 9, pointStyle: "rectRot", borderColor: color("bad"), borderWidth: 2.5, backgroundColor: "transparent"},
                    {label: "best trade-offs", showLine: true, borderColor: color("two"), backgroundColor: color("two"),
                        pointRadius: 4, borderWidth: 1.5,
                        data: finite.filter((point) => point.pareto).map(toXy).sort((a, b) => a.x - b.x)},
                    {label: "others", data: finite.filter((point) => !point.pareto).map(toXy), pointRadius: 2.5,
                        backgroundColor: color("one"), borderColor: color("one")},
                ],
            },
            options: {
                scales: {
                    x: axis("end of the session after the last word, median in ms"),
                    y: axis("sessions that lose words (ended early or missed), %", {beginAtZero: true}),
                },
                plugins: {
                    legend: legend(),
                    tooltip: {callbacks: {label: (item) => [item.raw.vad, item.raw.x + " ms, " + item.raw.y.toFixed(1) + " %"]}},
                },
            },
        }), {tall: true});
        if (finite.length < data.points.length) {
            add(main, "p", data.points.length - finite.length +
                " points whose median session never ends are not drawn.", {class: "faint"});
        }
        heatMap("Sessions that lose words, %", "heatLost", percent, (point) => point.lost);
        heatMap("Latency of the end, ms", "heatLatency", latency, (point) => point.endLateMs);

        const columns = [["lost", "lost %", percent], ["early", "early %", percent], ["missed", "missed %", percent],
            ["unended", "never ended %", percent], ["falseBegin", "false begin %", percent],
            ["endLateMs", "end late ms", latency], ["endLateP90Ms", "90 %", latency]];
        add(main, "h2", "Held out: the chosen point on sounds that did not choose it");
        const judged = table(["", ...columns.filter((one) => one[0] !== "unended").map((one) => one[1])]);
        const heldOut = add(judged, "tr", null, {"data-row": "heldOut"});
        add(heldOut, "td", data.advice.foldsThatAgree + " of " + data.advice.folds + " parts choose the same point");
        for (const [name, , format] of columns) {
            if (name !== "unended") cell(heldOut, name, data.advice.heldOut[name], format(data.advice.heldOut[name]));
        }
        add(main, "h2", "All points");
        const body = table(["parameters", ...columns.map((one) => one[1])]);
        for (const point of data.points) {
            const row = add(body, "tr", null, {
                "data-row": point.vad,
                class: (point.pareto ? "best " : "") + (point.vad === data.advice.vad ? "advised" : ""),
            });
            add(row, "td", settingName(point.vad));
            for (const [name, , format] of columns) cell(row, name, point[name], format(point[name]));
        }
        add(main, "p", "Bold: the best trade-offs. Marked: the chosen point.", {class: "faint"});
    }

    const tools = {data, main, add, cell, table, head, color, charts, timeCharts, waveform, follow};
    ({vad: vadReport, score: scoreReport, sweep: sweepReport,
        recording: () => drawRecordings(tools)})[data.report]();
})();
