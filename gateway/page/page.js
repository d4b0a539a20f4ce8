"use strict";
// Asks the gateway for what changed and draws it. What clients sent becomes text of nodes, never
// markup: this file has no innerHTML, and the policy of the page would forbid it.
(function () {
    const POLL_MS = 500;
    const MAX_RECORDS = 100;
    const SVG = "http://www.w3.org/2000/svg";
    const HEIGHT = 92, BASE = 72, TOP = 8;
    const cards = new Map();
    const $ = (id) => document.getElementById(id);
    let instance = "";
    let version = 0;

    function add(parent, tag, text, className) {
        const element = document.createElement(tag);
        if (text !== undefined && text !== null) element.textContent = text;
        if (className) element.className = className;
        parent.appendChild(element);
        return element;
    }

    function draw(parent, tag, attributes, text) {
        const element = document.createElementNS(SVG, tag);
        for (const [name, value] of Object.entries(attributes)) element.setAttribute(name, value);
        if (text !== undefined) element.textContent = text;
        parent.appendChild(element);
        return element;
    }

    const time = (seconds) => new Date(seconds * 1000).toLocaleTimeString([], {hour12: false});
    const ms = (value) => Math.round(value).toLocaleString("en") + " ms";
    const seconds = (value) => (value / 1000).toFixed(1) + " s";
    const count = (value) => value.toLocaleString("en");

    // ---- one session ----

    function statusChip(session) {
        if (session.isRunning) return ["running", "live"];
        if (session.status === 0) return ["went away", "bad"];
        return [String(session.status), session.status === 200 ? "good" : "bad"];
    }

    function topLine(body, session) {
        const top = add(body, "div", null, "top");
        add(top, "span", time(session.begunAt), "time");
        const [text, className] = statusChip(session);
        add(top, "span", text, "chip status " + className);
        add(top, "span", session.isStreamed ? "streamed" : "whole", "chip");
        if (session.isCanceled) add(top, "span", "canceled", "chip bad");
    }

    function figures(body, session) {
        const list = add(body, "dl");
        const figure = (name, value, className) => {
            const pair = add(list, "div");
            add(pair, "dt", name);
            add(pair, "dd", value, className).dataset.name = name;
        };
        const said = (name, value) => { if (value !== "") figure(name, value, "said"); };
        said("uuid", session.uuid);
        said("session", session.sessionId);
        said("language", session.language);
        said("topic", session.topic);
        said("type", session.soundType);
        said("transcripts", session.transcripts);
        said("request", session.requestId);
        if (session.pieceCount > 0) {
            figure("pieces", count(session.pieceCount));
            figure("bytes", count(session.pieces.length < session.pieceCount || !session.isRunning
                ? session.bodyBytes : session.pieces.reduce((sum, piece) => sum + piece[1], 0)));
            figure("first", ms(session.pieces[0][0]));
            figure("last", ms(session.lastMs));
            if (session.pieceCount > 1) figure("longest gap", ms(session.longestGapMs));
        }
        if (session.soundMs > 0) figure("sound", seconds(session.soundMs));
        if (session.decodeMs > 0) figure("decoding", ms(session.decodeMs));
        if (!session.isRunning && session.status !== 0 && session.pieceCount > 0) {
            figure("answer after", ms(session.answerMs));
        }
    }

    function hypotheses(body, session) {
        if (session.hypotheses.length === 0) return;
        const list = add(body, "ol");
        for (const hypothesis of session.hypotheses) {
            const item = add(list, "li");
            const meter = add(item, "meter");
            meter.value = hypothesis.confidence;
            add(item, "span", hypothesis.confidence.toFixed(2), "number");
            add(item, "span", hypothesis.text, "said hypothesis");
        }
    }

    /** Round numbers below the axis, about six of them. */
    function axis(svg, endMs, x) {
        const rough = endMs / 6;
        const power = Math.pow(10, Math.floor(Math.log10(Math.max(rough, 1))));
        const step = [1, 2, 5, 10].map((one) => one * power).find((one) => one >= rough);
        for (let at = 0; at <= endMs; at += step) {
            draw(svg, "line", {class: "base", x1: x(at), x2: x(at), y1: BASE, y2: BASE + 4});
            const anchor = at === 0 ? "start" : at > endMs * 0.96 ? "end" : "middle";
            draw(svg, "text", {x: x(at), y: BASE + 17, "text-anchor": anchor},
                endMs < 2000 ? at + " ms" : at / 1000 + " s");
        }
    }

    /** A bar for each piece, at its time of arrival and as high as it is long. */
    function timeline(body, session) {
        if (session.pieces.length === 0) return;
        const isAnswered = !session.isRunning && session.status !== 0;
        const answerAt = session.lastMs + session.answerMs;
        const endMs = Math.max(isAnswered ? answerAt : session.lastMs, 1);
        const longest = Math.max(...session.pieces.map((piece) => piece[1]));
        const width = Math.max(body.clientWidth, 300);
        const x = (at) => Number((at / endMs * (width - 4)).toFixed(1));
        const svg = draw(body, "svg", {
            viewBox: "0 0 " + width + " " + HEIGHT, role: "img",
            "aria-label": session.pieceCount + " pieces in " + ms(session.lastMs),
        });
        draw(svg, "line", {class: "base", x1: 0, x2: width, y1: BASE, y2: BASE});
        for (const [at, bytes] of session.pieces) {
            const height = Math.max(2, bytes / longest * (BASE - TOP));
            const bar = draw(svg, "rect", {
                class: "piece", x: x(at), y: (BASE - height).toFixed(1), width: 2.5, height: height.toFixed(1),
            });
            draw(bar, "title", {}, count(bytes) + " bytes after " + ms(at));
        }
        axis(svg, endMs, x);
        if (isAnswered) {
            draw(svg, "line", {class: "answer", x1: x(answerAt), x2: x(answerAt), y1: 0, y2: BASE});
            draw(svg, "text", {class: "answer-text", x: x(answerAt) - 6, y: TOP, "text-anchor": "end"}, "answer");
        }
    }

    /** Plays what the gateway has; asks for it only when it is wanted. */
    function player(card, session) {
        const box = card.player;
        if (session.playableMs === 0) return;
        if (!box.firstChild) {
            const button = add(box, "button", "Play");
            button.addEventListener("click", () => load(box, card).catch(() => { button.textContent = "no sound"; }));
            add(box, "span", "", "faint");
        }
        const note = box.querySelector("span");
        note.textContent = session.playableMs < session.soundMs
            ? "the first " + seconds(session.playableMs) + " of " + seconds(session.soundMs)
            : session.isRunning ? seconds(session.playableMs) + " so far" : seconds(session.playableMs);
    }

    async function load(box, card) {
        const answer = await fetch("page/sound?id=" + card.id, {cache: "no-store"});
        if (!answer.ok) throw new Error("status " + answer.status);
        const old = box.querySelector("audio");
        if (old) URL.revokeObjectURL(old.src);
        const audio = old || document.createElement("audio");
        audio.controls = true;
        audio.src = URL.createObjectURL(await answer.blob());
        if (!old) box.appendChild(audio);
        box.querySelector("button").textContent = "Load again";
        box.querySelector("button").hidden = !card.isRunning;
        await audio.play();
    }

    function makeCard(id) {
        const element = document.createElement("article");
        element.className = "session";
        element.dataset.session = id;
        const card = {id, element, body: add(element, "div"), player: add(element, "div", null, "player")};
        $("sessions").prepend(element);
        cards.set(id, card);
        return card;
    }

    function show(session) {
        const card = cards.get(session.id) || makeCard(session.id);
        card.isRunning = session.isRunning;
        card.element.dataset.state = session.isRunning ? "running" : "ended";
        card.body.textContent = "";
        topLine(card.body, session);
        figures(card.body, session);
        if (session.refusal !== "") add(card.body, "p", session.refusal, "reason said");
        if (session.remark !== "") add(card.body, "p", session.remark, "faint said");
        hypotheses(card.body, session);
        timeline(card.body, session);
        player(card, session);
    }

    // ---- the page ----

    function remove(card) {
        const audio = card.player.querySelector("audio");
        if (audio) URL.revokeObjectURL(audio.src);
        card.element.remove();
        cards.delete(card.id);
    }

    function showRecord(record) {
        const row = document.createElement("tr");
        add(row, "td", time(record.at));
        add(row, "td", String(record.status));
        add(row, "td", record.uuid, "uuid said");
        add(row, "td", record.text, "record said");
        const body = $("records");
        body.prepend(row);
        while (body.children.length > MAX_RECORDS) body.lastChild.remove();
    }

    function apply(changes) {
        if (changes.instance !== instance) {
            for (const card of [...cards.values()]) remove(card);
            $("records").textContent = "";
        }
        const ids = new Set(changes.ids);
        for (const card of [...cards.values()]) {
            if (!ids.has(card.id)) remove(card);
        }
        changes.sessions.forEach(show);
        changes.records.forEach(showRecord);
        instance = changes.instance;
        version = changes.version;
        $("no-sessions").hidden = cards.size > 0;
        $("no-records").hidden = $("records").children.length > 0;
        $("record-box").hidden = !$("no-records").hidden;
    }

    function say(state, text) {
        if ($("link").dataset.state !== state) {
            $("link").dataset.state = state;
            $("link").textContent = text;
        }
    }

    async function poll() {
        try {
            const answer = await fetch("page/changes?instance=" + instance + "&after=" + version,
                {cache: "no-store"});
            if (!answer.ok) throw new Error("status " + answer.status);
            apply(await answer.json());
            say("live", "live");
        } catch (failure) {
            say("lost", "the gateway does not answer; trying again");
        }
        setTimeout(poll, POLL_MS);
    }

    poll();
})();
