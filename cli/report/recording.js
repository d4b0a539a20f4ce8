"use strict";
// Draws the report on recorded sessions, with the tools of report.js.
function drawRecordings(tools) {
    const {data, main, add, cell, table, head, color, charts, timeCharts, waveform, follow} = tools;
    const STAGE_COLORS = ["one", "two", "three", "faint", "one", "two", "three"];
    const detailed = document.createElement("div");

    const name = (folder) => folder.replace(/\/+$/, "").split("/").pop();

    // ---- stages ----

    function stageTable(detail) {
        add(detailed, "h2", "From the end of speech to the " + (detail.outcome || "end"));
        if (detail.missing) {
            add(detailed, "p", "No times: " + detail.missing + ".");
            return;
        }
        const body = table(["stage", "ms", ""], "stages", detailed);
        data.stages.forEach((stage, index) => {
            const row = add(body, "tr");
            add(row, "td", stage.title);
            cell(row, stage.name, detail.stages[stage.name], detail.stages[stage.name]);
            const box = add(row, "td");
            const bar = add(box, "meter", null, {min: 0, max: Math.max(1, detail.totalMs), "aria-hidden": "true"});
            bar.value = detail.stages[stage.name];
            bar.dataset.color = STAGE_COLORS[index];
        });
        const total = add(body, "tr", null, {class: "best"});
        add(total, "td", "total");
        cell(total, "totalMs", detail.totalMs, detail.totalMs);
        add(total, "td");
    }

    // ---- charts ----

    /** The lanes of a session: a title, bars from a time to another, and ticks. */
    function makeLanes(detail) {
        const {buffers, encoded, detector, attempts, happened} = detail.lanes;
        const lanes = [];
        const lane = (title) => {
            lanes.push({title, bars: [], ticks: []});
            return lanes[lanes.length - 1];
        };
        const bar = (to, from, until, shade, text) => {
            if (until > from) to.bars.push({from, until, shade, text});
        };
        const application = lane("application");
        const events = lane("events");
        for (const one of happened) {
            // The results follow at once and would be covered.
            if (one.name === "finished") continue;
            (one.kind === "call" ? application : events).ticks.push(
                {at: one.ms, shade: one.name === "error" ? "bad" : "text", text: one.name});
        }
        const recorder = lane("recorder");
        for (const at of buffers) recorder.ticks.push({at, shade: "faint"});
        const speech = lane("detector");
        detector.forEach((change, index) => {
            const next = detector[index + 1];
            if (change.speech) bar(speech, change.ms, next ? next.ms : detail.lengthMs, "three", "speech");
        });
        const encoder = lane("encoder");
        for (const piece of encoded) encoder.ticks.push({at: piece.ms, shade: "two"});
        for (const attempt of attempts) {
            const network = lane(attempts.length > 1 ? "network " + attempt.attempt : "network");
            const end = attempt.endMs === undefined ? detail.lengthMs : attempt.endMs;
            let from = attempt.ms;
            for (const [stage, shade] of [["lookup", "two"], ["connected", "faint"], ["tls", "three"]]) {
                if (typeof attempt[stage] === "number") {
                    bar(network, from, attempt.ms + attempt[stage], shade, stage === "connected" ? "connect" : stage);
                    from = Math.max(from, attempt.ms + attempt[stage]);
                }
            }
            const last = attempt.sent.length ? attempt.sent[attempt.sent.length - 1].ms : from;
            for (const piece of attempt.sent) network.ticks.push({at: piece.ms, shade: "one"});
            const headMs = attempt.headMs === undefined ? end : attempt.headMs;
            bar(network, last, headMs, "mark", "waiting");
            bar(network, headMs, end, "three", "answer");
            network.ticks.push({at: end, shade: attempt.code >= 200 && attempt.code < 300 ? "three" : "bad",
                text: attempt.code === undefined ? "open" : String(attempt.code)});
        }
        if (!detail.missing) {
            const stages = lane("stages");
            let from = detail.beginMs;
            data.stages.forEach((stage, index) => {
                bar(stages, from, from + detail.stages[stage.name], STAGE_COLORS[index], stage.name);
                from += detail.stages[stage.name];
            });
        }
        return lanes;
    }

    /** Writes texts from left to right, the last ones to the left of the edge; none covers another. */
    function drawTexts(ctx, texts, y, edge) {
        let free = -Infinity;
        for (const {at, text} of texts.sort((one, other) => one.at - other.at)) {
            const width = ctx.measureText(text).width;
            const left = at + width > edge ? at - width - 12 : at;
            if (left < free) continue;
            ctx.fillText(text, left, y);
            free = left + width + 8;
        }
    }

    function lanesPlugin(lanes) {
        return {
            id: "lanes",
            afterDatasetsDraw(chart) {
                const {ctx, chartArea: area, scales: {x, y}} = chart;
                ctx.save();
                ctx.font = "12px system-ui, sans-serif";
                ctx.textBaseline = "middle";
                ctx.textAlign = "right";
                ctx.fillStyle = color("faint");
                lanes.forEach((lane, index) => {
                    ctx.fillText(lane.title, area.left - 8, y.getPixelForValue(index + 0.5));
                });
                ctx.textAlign = "left";
                ctx.beginPath();
                ctx.rect(area.left, area.top, area.width, area.height);
                ctx.clip();
                ctx.font = "11px system-ui, sans-serif";
                lanes.forEach((lane, index) => {
                    const top = y.getPixelForValue(index) + 5;
                    const height = y.getPixelForValue(index + 1) - 5 - top;
                    const texts = [];
                    for (const {from, until, shade, text} of lane.bars) {
                        const left = x.getPixelForValue(from / 1000);
                        const width = Math.max(1, x.getPixelForValue(until / 1000) - left);
                        ctx.globalAlpha = 0.45;
                        ctx.fillStyle = color(shade);
                        ctx.fillRect(left, top, width, height);
                        ctx.globalAlpha = 1;
                        if (ctx.measureText(text).width + 8 < width) texts.push({at: left + 4, text});
                    }
                    for (const {at, shade, text} of lane.ticks) {
                        const left = x.getPixelForValue(at / 1000);
                        ctx.fillStyle = color(shade);
                        ctx.fillRect(left - 0.75, top, 1.5, height);
                        if (text) texts.push({at: left + 4, text});
                    }
                    ctx.fillStyle = color("text");
                    drawTexts(ctx, texts, top + height / 2, area.right);
                });
                ctx.restore();
            },
        };
    }

    function drawCharts(detail) {
        const audio = detail.audio ? add(detailed, "audio", null, {controls: "", src: detail.audio}) : null;
        if (!audio) {
            add(detailed, "p", detail.wave ? "The sound is too long to be part of this page." : "There is no sound.",
                {class: "faint"});
        }
        const soundBeginS = detail.wave ? detail.soundBeginMs / 1000 : 0;
        const marks = {
            id: "marks",
            afterDatasetsDraw(chart) {
                const {ctx, chartArea: area, scales: {x}} = chart;
                const line = (seconds, shade, dash) => {
                    const at = x.getPixelForValue(seconds);
                    if (at < area.left || at > area.right) return;
                    ctx.strokeStyle = color(shade);
                    ctx.setLineDash(dash);
                    ctx.beginPath();
                    ctx.moveTo(at, area.top);
                    ctx.lineTo(at, area.bottom);
                    ctx.stroke();
                };
                ctx.save();
                ctx.lineWidth = 1.5;
                if (detail.knowsSpeechEnd) line(detail.beginMs / 1000, "bad", [4, 3]);
                if (audio) line(soundBeginS + audio.currentTime, "text", []);
                ctx.restore();
            },
        };
        const timeChart = timeCharts({
            audio, soundBeginS, fromS: Math.min(0, soundBeginS), toS: detail.lengthMs / 1000 || 1, yWidth: 96, marks,
            parent: detailed,
        });
        if (detail.wave) {
            timeChart("Waveform", () => waveform(detail.wave, soundBeginS), {title: "sample"});
        }
        const lanes = makeLanes(detail);
        timeChart("What happened when", () => [], {
            title: "", type: "linear", min: 0, max: lanes.length, reverse: true,
            grid: {color: color("line")},
            ticks: {display: false, stepSize: 1},
        }, {
            height: 60 + 34 * lanes.length,
            plugin: lanesPlugin(lanes),
        });
        if (audio) follow(audio);
        add(detailed, "p", "The dashed line is the end of speech. A tick of the recorder is a buffer that arrived, " +
            "of the encoder a piece of encoded sound, of the network a piece of the body. Click into a chart to play " +
            "from there.", {class: "faint"});
    }

    /** Times of each attempt: those of its connection, then of its body and its answer. */
    function attempts(detail) {
        if (detail.lanes.attempts.length === 0) return;
        add(detailed, "h2", "Network");
        const body = table(["attempt", "after ms", "lookup ms", "connect ms", "TLS ms", "pieces", "waiting ms",
            "answer ms", "end"], "attempts", detailed);
        const isNumber = (value) => typeof value === "number";
        const between = (from, to) => isNumber(from) && isNumber(to) ? Math.max(0, to - from) : null;
        const shown = (value) => value === null ? "-" : value.toFixed(1);
        for (const attempt of detail.lanes.attempts) {
            const row = add(body, "tr");
            const kind = attempt.isNew === undefined ? "no connection" : attempt.isNew ? "new connection" : "kept connection";
            add(row, "td", attempt.attempt + ", " + kind);
            const lookup = isNumber(attempt.lookup) ? attempt.lookup : null;
            const connect = between(lookup === null ? 0 : lookup, attempt.connected);
            const tls = between(attempt.connected, attempt.tls);
            const last = attempt.sent.length ? attempt.sent[attempt.sent.length - 1].ms : attempt.readyMs;
            cell(row, "attemptMs", attempt.ms, attempt.ms.toFixed(1));
            cell(row, "lookup", lookup, shown(lookup));
            cell(row, "connect", connect, shown(connect));
            cell(row, "tls", tls, shown(tls));
            cell(row, "pieces", attempt.sent.length, attempt.sent.length);
            const waiting = between(last, attempt.headMs);
            cell(row, "waiting", waiting, shown(waiting));
            const answer = between(attempt.headMs, attempt.endMs);
            cell(row, "answer", answer, shown(answer));
            const end = attempt.code === undefined ? "open" : [attempt.code, attempt.reason].filter((one) => one !== "").join(": ");
            add(row, "td", end, {class: "words"});
        }
    }

    function happenings(detail) {
        add(detailed, "h2", "Calls and events");
        const body = table(["", "after ms", "what"], "happened", detailed);
        for (const one of detail.lanes.happened) {
            const row = add(body, "tr");
            add(row, "td", one.kind + " " + one.name);
            cell(row, "happenedMs", one.ms, one.ms.toFixed(1));
            add(row, "td", one.text, {class: "words"});
        }
    }

    function show(detail) {
        for (const {chart} of charts.splice(0)) chart.destroy();
        detailed.textContent = "";
        if (data.details.length > 1) add(detailed, "h2", name(detail.folder), {id: "detail"});
        add(detailed, "p", [detail.time, detail.source, detail.kit === "" ? "" : "engine " + detail.kit]
            .filter((text) => text !== "").join(", "), {class: "faint"});
        for (const remark of detail.remarks) add(detailed, "p", remark, {class: "remark"});
        stageTable(detail);
        drawCharts(detail);
        attempts(detail);
        happenings(detail);
    }

    // ---- many sessions ----

    function overview() {
        const statistics = data.statistics;
        head(statistics.sessions + " recorded sessions", [data.version,
            statistics.measured + " with times from the end of speech on"]);
        const body = table(["stage", "median ms", "90 % ms"]);
        const row = (title, id, figures) => {
            const line = add(body, "tr", null, {"data-row": id});
            add(line, "td", title);
            cell(line, "median", figures.median, figures.median === null ? "-" : figures.median);
            cell(line, "p90", figures.p90, figures.p90 === null ? "-" : figures.p90);
        };
        for (const stage of data.stages) row(stage.title, stage.name, statistics.stages[stage.name]);
        row("total", "total", statistics.total);
        add(main, "h2", "The slowest");
        const slowest = table(["session", "total ms", "started"]);
        data.details.forEach((detail, index) => {
            const line = add(slowest, "tr");
            const link = add(add(line, "td"), "a", name(detail.folder), {href: "#" + index});
            link.addEventListener("click", () => show(detail));
            cell(line, "slowestMs", detail.totalMs, detail.totalMs);
            add(line, "td", detail.time);
        });
    }

    if (data.statistics.sessions === 1) {
        head(name(data.details[0].folder), [data.version]);
    } else {
        overview();
    }
    main.appendChild(detailed);
    const first = data.details[Number(location.hash.slice(1))] || data.details[0];
    if (first) show(first);
}
