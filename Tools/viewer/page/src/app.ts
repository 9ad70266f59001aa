// The page: a recording, a player, and everything that shows where they are.

import { adjustmentIn, asRecorded, isSame, type Adjustment } from './adjust/adjustment';
import { showAdjusting } from './adjust/dialog';
import { Address, followLayers, type WholeView } from './address';
import { Decoder } from './decoder/client';
import { EntriesPane } from './entries/pane';
import { showCheck, showFacts } from './facts/pane';
import { InsightTables } from './insights/tables';
import type { Range } from './lanes/axis';
import type { Lane } from './lanes/lane';
import { arrangeLanes } from './lanes/dialog';
import { Timeline } from './lanes/timeline';
import { clock, shown } from './model/format';
import { decimal } from './model/decimals';
import { shortestIdle } from './model/idle';
import { markerAfter, markerBefore } from './model/markers';
import type { Decoded, Session } from './model/session';
import { partsOf, rangeIn, rangeText, timeInLink } from './model/link';
import { Movie, stillProblem } from './movie';
import { NotesPane } from './notes/pane';
import { Opening, sessionOf, type Arrival } from './opening';
import { RangeBar } from './range/bar';
import { Selection } from './range/selection';
import { zoomStage } from './stage/handling';
import { layers } from './stage/layers';
import { Player } from './stage/player';
import { Stage } from './stage/stage';
import { afterIdle } from './transport/skipping';
import { setUpAutomation } from './ui/automation';
import { breath } from './ui/breath';
import { setUpControls, type Controls } from './ui/controls';
import { ask, setUpDialogs } from './ui/dialogs';
import { announce, byId, setText } from './ui/dom';
import { setUpDrop } from './ui/drop';
import { placeIcons } from './ui/icons';
import { setUpKeys } from './ui/keys';
import { mark, measured } from './ui/marks';
import type { Page } from './ui/page';
import { setUpRoom } from './ui/room';
import { saveBlob } from './ui/save';
import { setUpSplitters } from './ui/splitter';
import { setUpTabs, showTab } from './ui/tabs';
import { setUpTheme } from './ui/theme';
import { wordsOf } from './ui/words';

export class App implements Page {
  readonly player = new Player(byId<HTMLVideoElement>('movie'));
  readonly decoder = new Decoder();
  readonly selection = new Selection();
  skipsIdle = false;
  private readonly insights = new InsightTables({
    ask: async (name, parameters) => (await this.decoder.insights({ name, parameters }))[0]!,
    onLoaded: () => this.requestFrame(),
    onProblem: (text) => this.complain(text),
  });
  readonly stage = new Stage(this.player, this.insights);
  private readonly opening = new Opening(this.decoder, {
    lanesOf: (session) => this.timeline.lanesOf(session),
    onArrival: (arrival) => this.arrive(arrival),
    onProblem: (text) => this.complain(text),
  });
  private readonly address = new Address(() => this.viewToLink());
  private readonly movie = new Movie();
  /// What is recorded, and how the reader says that it belongs to the movie.
  private decoded: Decoded | undefined;
  private adjustment = asRecorded;
  /// Counts the adjustments. The last one holds.
  private adjusted = 0;
  session: Session | undefined;
  /// The lanes of a new recording come last: with all of the layout they would be one long task.
  isShown = false;
  private isFramePending = false;
  private onlyTimeMoves = false;
  private shownMovie = '';
  private drawnTime = -1;
  /// The recording whose entries are shown as the address says.
  private linked: Session | undefined;
  private controls!: Controls;
  private readonly timeline: Timeline;
  private readonly entries: EntriesPane;
  private readonly notes: NotesPane;
  /// Whether the heat map tells of the selection, and whether it was on before.
  private heat = { isOfSelection: false, wasOn: false };
  private readonly rangeBar: RangeBar;

  constructor() {
    const showsKeys = () => this.stage.showsKeys;
    this.timeline = new Timeline({
      showsKeys,
      region: () => this.stage.placement.region,
      notes: () => this.notes.all,
      onSeek: (time) => this.seek(time),
      onRange: () => {
        this.rangeChanged();
        this.address.write();
      },
      onSelect: (one, other) => this.selection.select(one, other),
      onExtend: (time) => {
        this.selection.extend(this.player.time, time);
        this.seek(time);
      },
    });
    this.entries = new EntriesPane({
      showsKeys,
      onSeek: (time) => this.seek(time),
      onSave: () => void this.save(),
      onProblem: (text) => this.complain(text),
      onChange: () => this.address.write(),
    });
    this.notes = new NotesPane({
      time: () => this.player.time,
      onSeek: (time) => this.seek(time),
      onProblem: (text) => this.complain(text),
      onChange: () => {
        this.timeline.refreshLanes();
        this.requestFrame();
      },
    });
    this.rangeBar = new RangeBar(this.selection, {
      insights: (range) => this.insightsIn(range),
      movieName: () => this.fileName(),
      hasMovie: () => this.movie.url !== null,
      link: () => location.href.replace(/#.*/, '') + this.address.linkTo(this.view()),
      onZoom: (range) => this.timeline.setRange(range),
      onFilter: ({ from, to }) => {
        showTab('tab-entries');
        this.entries.showBetween(from, to);
      },
      onProblem: (text) => this.complain(text),
    });
    this.selection.onChange = () => this.selectionChanged();
  }

  start(): void {
    mark('zulm:start');
    if (document.getElementById('zulm-recording')) this.decoder.prepare();
    placeIcons();
    setUpTabs(() => this.requestFrame());
    setUpRoom();
    setUpSplitters();
    setUpDialogs();
    setUpDrop((files) => void this.opening.openFiles(files));
    this.controls = setUpControls(this);
    setUpKeys(this);
    setUpAutomation(this);
    setUpTheme(() => {
      this.timeline.invalidate();
      this.requestFrame();
    });
    byId('notice-close').addEventListener('click', () => void (byId('notice').hidden = true));
    window.addEventListener('hashchange', () => {
      void this.followLink();
      this.followLinkToEntries();
    });
    this.player.onChange = () => this.playerChanged();
    this.player.onPicture = () => this.pictureChanged();
    this.player.skip = (time) => (this.skipsIdle ? afterIdle(this.session?.idle ?? [], time) : undefined);
    this.stage.images.onDecoded = this.stage.onReady = () => this.requestFrame();
    this.opening.openEmbedded();
  }

  get finished(): number {
    return this.opening.finished;
  }

  // What is open

  /// Nothing here waits: what was shown before stays whole until all of the new recording is there.
  private arrive({ id, decoded, adjustment, session, lanes, movie, address, problems }: Arrival): void {
    this.movie.set(movie);
    if (address !== undefined) history.replaceState(null, '', address);
    [this.decoded, this.adjustment] = [decoded, adjustment];
    ++this.adjusted;
    this.decoder.keep(id); // what is drawn first may ask it
    this.show(session, lanes);
    if (problems.length > 0) this.complain(`Not everything could be read. ${problems.join('; ')}.`);
  }

  private show(session: Session, lanes: Lane[]): void {
    this.session = session;
    this.isShown = false;
    document.body.classList.remove('is-empty');
    document.title = `${shown(session.name)} – ZULMetaData`;
    setText(byId('recording-name'), shown(session.name));
    this.loadMovie(session);
    this.notes.show(session, this.adjustment.offset);
    this.selection.start(this.player.duration);
    this.showSession(session, lanes);
    this.stage.zoom.reset();
    this.selectionChanged();
    void this.followLink();
    void this.showDetails(session, this.firstPicture, () => {
      this.entries.show(session);
      this.followLinkToEntries();
    });
  }

  private firstPicture = (): void => {
    this.isShown = true;
    this.frame();
    mark('zulm:first-picture');
  };

  private loadMovie(session: Session): void {
    const canHavePictures = session.container !== 'stream' || this.movie.isAnother;
    const isGuessed = session.movieDuration === undefined || this.movie.isAnother;
    this.player.load(canHavePictures ? this.movie.url : null, session.duration, isGuessed);
  }

  private showSession(session: Session, lanes: Lane[]): void {
    this.session = session;
    this.insights.start(session.duration, this.adjustment.offset);
    this.stage.show(session);
    this.timeline.show(session, lanes, this.player.duration);
  }

  /// Only what belongs to the adjustment changes. The movie goes on unless the reader chooses another one; null is the
  /// movie of the recording.
  private async adjust(adjustment: Adjustment, movie?: File | null): Promise<void> {
    const hasOtherMovie = movie ? true : movie === null && this.movie.isAnother;
    const { decoded } = this;
    if (!decoded || (isSame(adjustment, this.adjustment) && !hasOtherMovie)) return;
    const adjusted = ++this.adjusted;
    const session = await sessionOf(decoded, adjustment);
    const lanes = await this.timeline.lanesOf(session);
    if (adjusted !== this.adjusted) return;
    this.adjustment = adjustment;
    if (movie) this.movie.replace(movie);
    else if (hasOtherMovie) this.movie.restore();
    if (hasOtherMovie) this.loadMovie(session);
    else this.player.setLength(session.duration, session.movieDuration === undefined || this.movie.isAnother);
    const { zoomed } = this.timeline;
    this.showSession(session, lanes);
    this.isShown = true;
    if (zoomed) this.timeline.setRange(zoomed);
    this.notes.setOffset(adjustment.offset);
    this.selection.setDuration(this.player.duration);
    this.rangeBar.forget();
    this.selectionChanged();
    await this.showDetails(session, () => this.entries.showAgain(session));
    this.address.write();
  }

  /// Shows one part at a time: `first`, and what may come after it.
  private async showDetails(session: Session, ...first: (() => void)[]): Promise<void> {
    const parts = [
      ...first,
      () => this.tellFacts(session),
      () => showCheck(session, this.player.size),
      () => this.requestFrame(),
    ];
    for (const show of parts) {
      await breath();
      if (session !== this.session) return;
      show();
    }
    this.linked = session;
    void this.stage.images.prepare(session.appearances);
    announce(`${shown(session.name)} is open`);
  }

  private tellFacts(session: Session): void {
    showFacts(session, this.player.duration, this.adjustment, {
      onAdjust: () =>
        showAdjusting(this.adjustment, { onAdjust: (adjustment, movie) => void this.adjust(adjustment, movie) }),
    });
  }

  // Time

  seek(time: number): void {
    this.player.seek(time);
    this.timeline.reveal(this.player.time);
  }

  step(seconds: number): void {
    this.seek(this.player.time + seconds);
  }

  stepFrame(direction: 1 | -1): void {
    this.player.stepFrame(direction);
    this.timeline.reveal(this.player.time);
  }

  stepMarker(direction: 1 | -1): void {
    const markers = this.session?.markers ?? new Float64Array();
    const { time } = this.player;
    const marker = direction > 0 ? markerAfter(markers, time) : markerBefore(markers, time);
    if (marker === undefined) return announce(direction > 0 ? 'No further marker' : 'No marker before');
    this.seek(marker);
    announce(`Marker at ${clock(marker)}`);
  }

  stepMatch(direction: 1 | -1): void {
    showTab('tab-entries');
    this.entries.step(direction);
  }

  zoom(factor: number): void {
    if (factor === 0) this.timeline.showAll();
    else this.timeline.zoom(factor);
  }

  pan(part: number): void {
    this.timeline.pan(part);
  }

  // The address

  /// Parts that the address lacks change nothing.
  private async followLink(): Promise<void> {
    if (!this.session) return;
    const parts = partsOf(location.hash);
    const adjustment = adjustmentIn(location.hash, this.adjustment);
    if (!isSame(adjustment, this.adjustment)) await this.adjust(adjustment);
    const zoom = rangeIn(parts.get('zoom'));
    if (zoom) this.timeline.setRange(zoom);
    const time = timeInLink(location.hash);
    if (time !== undefined && Math.abs(time - this.player.time) > 0.0005) this.seek(time);
    followLayers(parts.get('layers'));
    const range = rangeIn(parts.get('range'));
    const { range: selected } = this.selection;
    if (range && parts.get('range') !== (selected && rangeText(selected))) this.selection.select(range.from, range.to);
    this.controls.showState();
    this.requestFrame();
  }

  private followLinkToEntries(): void {
    const parts = partsOf(location.hash);
    this.entries.look(parts.get('stream'), parts.get('filter'));
    this.linked = this.session;
  }

  private view(): WholeView {
    return {
      time: this.player.time,
      zoom: this.timeline.zoomed,
      stream: this.entries.chosenStream,
      filter: this.entries.filterText,
      range: this.selection.range,
      adjustment: this.adjustment,
    };
  }

  /// The address does not follow the movie while it plays.
  private viewToLink(): WholeView | undefined {
    return this.session && this.linked === this.session && !this.player.playing ? this.view() : undefined;
  }

  // What is shown

  switchLayer(id: string): void {
    const layer = layers.find((layer) => layer.id === id);
    if (!layer) return;
    layer.isOn = !layer.isOn;
    if (id === 'heat' && !layer.isOn) this.selection.dropHeat();
    this.controls.showState();
    announce(`${layer.name} ${layer.isOn ? 'shown' : 'hidden'}`);
    this.address.write();
    this.requestFrame();
  }

  switchKeys(): void {
    this.stage.showsKeys = !this.stage.showsKeys;
    this.controls.showState();
    this.entries.refresh();
    this.timeline.invalidate();
    announce(this.stage.showsKeys ? 'Keys are shown' : 'Keys are masked');
    this.requestFrame();
  }

  arrangeLanes(): void {
    arrangeLanes(this.timeline);
  }

  writeNote(): void {
    showTab('tab-notes');
    this.notes.focusField();
  }

  findEntries(): void {
    showTab('tab-entries');
    this.entries.focusFilter();
  }

  // The selection

  private selectionChanged(): void {
    const { range, loops } = this.selection;
    this.player.loop = loops ? range : undefined;
    this.timeline.showSelection(range);
    this.rangeBar.show();
    this.followHeat();
    this.rangeChanged();
    this.address.write();
  }

  /// The heat map tells of the selection, or of what the lanes show.
  private rangeChanged(): void {
    const { range, hasHeat } = this.selection;
    const { from, to } = hasHeat && range ? range : this.timeline.range;
    this.stage.setHeatRange(from, to);
    this.requestFrame();
  }

  /// The layer is on while it tells of the selection, and afterwards as it was before.
  private followHeat(): void {
    const { hasHeat } = this.selection;
    if (hasHeat === this.heat.isOfSelection) return;
    const layer = layers.find(({ id }) => id === 'heat')!;
    this.heat = { isOfSelection: hasHeat, wasOn: hasHeat ? layer.isOn : this.heat.wasOn };
    const isWanted = hasHeat || (layer.isOn && this.heat.wasOn);
    if (isWanted !== layer.isOn) this.switchLayer('heat');
  }

  /// The range is one of the movie.
  private insightsIn({ from, to }: Range): ReturnType<Decoder['insights']> {
    const { offset } = this.adjustment;
    const parameters = { start: from - offset, end: to - offset };
    const activity = { ...parameters, least: shortestIdle };
    return this.decoder.insights({ name: 'activity', parameters: activity }, { name: 'applications', parameters });
  }

  selectSome(): void {
    this.timeline.selectSome();
  }

  switchLoop(): void {
    this.rangeBar.switchLoop();
  }

  // The movie

  switchSkipping(): void {
    this.skipsIdle = !this.skipsIdle;
    this.controls.showState();
    announce(this.skipsIdle ? 'Idle times are skipped' : 'Idle times are played');
  }

  zoomMovie(factor: number): void {
    zoomStage(this.stage.zoom, factor);
  }

  private fileName(): string {
    return this.movie.fileName(this.session?.name ?? 'recording');
  }

  saveStill(): void {
    const name = `${this.session?.name ?? 'recording'} ${decimal(this.player.time)}.png`;
    this.stage.still().then(
      (picture) => saveBlob(name, picture),
      (error) => this.complain(`The picture could not be saved: ${stillProblem(error)}.`),
    );
  }

  private playerChanged(): void {
    const { session, player } = this;
    if (session) {
      this.timeline.setDuration(player.duration);
      this.selection.setDuration(player.duration);
    }
    this.stage.fit();
    if (session && player.movie !== this.shownMovie) {
      this.shownMovie = player.movie;
      this.timeline.invalidate(); // the movie may show another part of the screen
      showCheck(session, player.size);
    }
    this.controls.showState();
    if (session) this.movie.tell(player.movie, session.region);
    this.address.write();
    this.requestFrame();
  }

  /// Picture and overlay are drawn together, before the browser shows either.
  private pictureChanged(): void {
    this.stage.drawPicture();
    this.frame();
  }

  complain(text: string): void {
    setText(byId('notice-text'), shown(text));
    byId('notice').hidden = false;
  }

  requestFrame(): void {
    this.onlyTimeMoves = false;
    if (this.isFramePending) return;
    this.isFramePending = true;
    requestAnimationFrame((now) => {
      this.isFramePending = false;
      this.player.tick(now);
      if (this.drawnTime !== this.player.time || !this.onlyTimeMoves) this.frame();
      this.onlyTimeMoves = false;
      if (!this.player.playing) return;
      this.requestFrame();
      this.onlyTimeMoves = true;
    });
  }

  private frame(): void {
    if (!this.session) return;
    measured('zulm:frame', () => {
      const { time, playing } = this.player;
      this.drawnTime = time;
      if (playing) this.timeline.reveal(time);
      this.stage.draw(time);
      if (this.isShown) this.timeline.draw(time);
      this.controls.showTime(time, this.player.duration);
      this.entries.setTime(time);
    });
  }

  // Saving

  private async save(): Promise<void> {
    const hasKeys = (this.session?.track('keyboardAction')?.count ?? 0) > 0;
    if (hasKeys && !this.stage.showsKeys) {
      const agrees = await ask(
        'Save with everything that was typed?',
        'The file will hold every key in clear, though this page masks them.',
        'Save',
      );
      if (!agrees) return;
    }
    try {
      const contents = new Blob([await this.decoder.dump()], { type: 'application/json' });
      saveBlob(`${this.session?.name ?? 'recording'}.json`, contents);
    } catch (error) {
      this.complain(`The entries could not be saved: ${wordsOf(error)}.`);
    }
  }
}
