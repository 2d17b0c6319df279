"use strict";

// Playheads over the graphs and marks on the map follow the player of their section; a click or a
// drag on a graph moves the player.
for (const section of document.querySelectorAll("section.entry")) {
    const audio = section.querySelector("audio");
    if (!audio) {
        continue;
    }
    const plots = [...section.querySelectorAll(".plot[data-seconds]")];
    const heads = plots.map((plot) => plot.querySelector(".playhead"));
    const seconds = plots.length > 0 ? Number(plots[0].dataset.seconds) : 0;
    const marks = [...section.querySelectorAll(".mark")].map((mark) => ({
        mark,
        // Four numbers a stop: seconds, x, y, degrees.
        track: mark.dataset.track.split(" ").map(Number),
    }));

    const moveMark = ({ mark, track }, time) => {
        const last = track.length - 4;
        let stop = 0;
        while (stop < last && track[stop + 4] <= time) {
            stop += 4;
        }
        const next = Math.min(stop + 4, last);
        const span = track[next] - track[stop];
        const part = span > 0 ? Math.min(Math.max((time - track[stop]) / span, 0), 1) : 0;
        const mixed = (i) => track[stop + i] + part * (track[next + i] - track[stop + i]);
        // The shorter way round, also across the back.
        const turn = ((track[next + 3] - track[stop + 3] + 540) % 360 + 360) % 360 - 180;
        const degrees = track[stop + 3] + part * turn;
        mark.setAttribute(
            "transform",
            `translate(${mixed(1).toFixed(1)} ${mixed(2).toFixed(1)}) rotate(${degrees.toFixed(1)})`,
        );
    };

    const show = () => {
        const time = audio.currentTime;
        section.classList.toggle("heard", time > 0 || !audio.paused);
        for (const head of heads) {
            head.style.left = `${(100 * Math.min(time / seconds, 1)).toFixed(3)}%`;
        }
        for (const one of marks) {
            moveMark(one, time);
        }
    };

    let running = false;
    const follow = () => {
        show();
        running = !audio.paused && !audio.ended;
        if (running) {
            requestAnimationFrame(follow);
        }
    };
    audio.addEventListener("play", () => {
        // One sound at a time.
        for (const other of document.querySelectorAll("audio")) {
            if (other !== audio) {
                other.pause();
            }
        }
        if (!running) {
            follow();
        }
    });
    for (const event of ["pause", "seeking", "seeked", "timeupdate"]) {
        audio.addEventListener(event, show);
    }
    audio.addEventListener("error", () => {
        const words = document.createElement("p");
        words.className = "note";
        words.setAttribute("role", "status");
        words.textContent = "This browser cannot play the sound.";
        audio.parentElement.append(words);
    });

    for (const plot of plots) {
        const seek = (event) => {
            const box = plot.getBoundingClientRect();
            const place = (event.clientX - box.left - plot.clientLeft) / plot.clientWidth;
            const end = Number.isFinite(audio.duration) ? audio.duration : seconds;
            audio.currentTime = Math.min(Math.max(place * seconds, 0), end);
            show();
        };
        plot.addEventListener("pointerdown", (event) => {
            if (event.button === 0) {
                plot.setPointerCapture(event.pointerId);
                seek(event);
            }
        });
        plot.addEventListener("pointermove", (event) => {
            if (plot.hasPointerCapture(event.pointerId)) {
                seek(event);
            }
        });
    }
}

// Paper cannot be unfolded.
addEventListener("beforeprint", () => {
    for (const details of document.querySelectorAll("details")) {
        details.open = true;
    }
});
