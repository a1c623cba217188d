// How the report's page looks.
#pragma once

namespace tool {

inline constexpr const char* kPageStyle = R"css(
:root { color-scheme: light dark; --page: #fcfcfb; --ink: #1c1c1a; --soft: #6a6963; --rule: #e4e3dd;
  --blue: #2a78d6; --bars: #9dc0ea; --orange: #d95926; --red: #d03b3b; --still: #d03b3b22; }
@media (prefers-color-scheme: dark) { :root { --page: #1a1a19; --ink: #f2f1ec; --soft: #a3a198;
  --rule: #34332f; --blue: #5598e7; --bars: #2f5f9b; --orange: #e87a48; --red: #e66767; --still: #e6676733; } }
* { box-sizing: border-box; }
body { margin: 0; background: var(--page); color: var(--ink); font: 15px/1.45 system-ui, sans-serif; }
main { max-width: 1040px; margin: 0 auto; padding: 1.2rem 1rem 3rem; }
h1 { font-size: 1.5rem; margin: 0 0 1rem; }
h2 { font-size: 1.1rem; margin: 2.2rem 0 .6rem; }
small { color: var(--soft); font-weight: normal; font-size: .85em; }
figure { margin: 0; }
figcaption { font-weight: 600; }
.tiles { display: grid; grid-template-columns: repeat(auto-fit, minmax(9.5rem, 1fr)); gap: .8rem 1.2rem;
  margin: 0 0 1.6rem; }
.tiles dt { color: var(--soft); font-size: .85em; }
.tiles dd { margin: 0; font-size: 1.35rem; font-weight: 600; }
.tiles small { display: block; font-size: .8rem; }
.plot { display: grid; grid-template: auto 1.2em 110px 1.5em / 3.2em minmax(0, 1fr); margin-bottom: .9rem; }
.plot figcaption { grid-column: 1 / 3; }
.plot svg { grid-area: 3 / 2; width: 100%; height: 110px; }
.numbers { grid-area: 2 / 2; position: relative; }
.values { grid-area: 3 / 1; position: relative; }
.times { grid-area: 4 / 2; position: relative; }
.values, .times { color: var(--soft); font-size: .75rem; font-variant-numeric: tabular-nums; }
.values span { position: absolute; right: .6em; transform: translateY(-50%); }
.times span, .numbers b { position: absolute; transform: translateX(-50%); white-space: nowrap; }
.times span:first-child { transform: none; }
.times span:last-child { transform: translateX(-80%); }
.numbers b, .legend b { color: var(--page); background: var(--soft); border-radius: .6em; padding: 0 .45em;
  font-size: .7rem; line-height: 1.5; }
.plot path { fill: none; stroke-width: 1.6; vector-effect: non-scaling-stroke; }
.plot .grid { stroke: var(--rule); stroke-width: 1; }
.plot .line { stroke: var(--blue); stroke-linejoin: round; }
.plot .asked { stroke: var(--soft); stroke-dasharray: 5 4; }
.plot .bar { stroke: var(--bars); }
.plot .key { stroke: var(--orange); stroke-width: 2; }
.plot .change { stroke: var(--soft); stroke-width: 1; stroke-dasharray: 2 3; }
.plot .loss { stroke: var(--red); stroke-width: 2; }
.frozen { fill: var(--still); }
i.key { color: var(--orange); font-style: normal; }
.legend { list-style: none; display: flex; flex-wrap: wrap; gap: .3rem 1.4rem; margin: 0; padding: 0 0 0 3.2em;
  font-size: .9rem; }
.legend i { display: inline-block; height: .8em; width: 2px; background: var(--red); margin-right: .3em; }
.legend i.still { width: 1em; background: var(--still); }
.pair { margin-bottom: 1.2rem; }
.pair div { display: grid; grid-template-columns: 1fr 1fr; gap: .5rem; align-items: start; }
.pair img { display: block; width: 100%; }
table { border-collapse: collapse; }
th { text-align: left; font-weight: normal; color: var(--soft); padding: .15rem 1.4rem .15rem 0;
  vertical-align: top; white-space: nowrap; }
td { padding: .15rem 0; }
)css";

}  // namespace tool
